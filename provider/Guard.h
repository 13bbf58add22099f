// Guard: keeps pages of other origins that run in the user's browser away from the provider. Programs are let in as
// they are: whoever can run one on this machine needs no browser for it.
#pragma once

#include "Http.h"

namespace provider {

// Throws ApiError: 421 when the client addressed another host than the loopback (a foreign name that was made to
// point here), 403 when a page of another origin asks for /admin.
void checkCaller(const Call& call);

// Adds headers by which a browser shows the reply to pages of this origin alone, and runs nothing that is in it;
// those that the reply has already stay.
void protectReply(Reply& reply);

}  // namespace provider
