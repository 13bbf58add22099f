// Context: what the services of one provider share. Outlives them; each part guards itself.
#pragma once

#include "Faults.h"
#include "RequestLog.h"
#include "Store.h"
#include "Tokens.h"

namespace provider {

struct Context {
    explicit Context(std::chrono::seconds tokenLifetime) : tokens(tokenLifetime) {}

    Store store;
    Tokens tokens;
    Faults faults;
    RequestLog log;
};

}  // namespace provider
