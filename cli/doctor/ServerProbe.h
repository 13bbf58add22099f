// ServerProbe.h: one look at a server: whether it answers, what its certificate is worth, what time it has. A request for
// the head of the address, without any credential.
#pragma once

#include <cstdint>
#include <string>

struct ServerAnswer {
    bool isReached = false;
    std::string failure;             // why it was not reached
    std::string certificateProblem;  // why a verifying client would refuse it; "" for none, and without TLS
    int64_t certificateEndSec = 0;   // since 1970, 0: not known
    int64_t dateSec = 0;             // the server's clock, 0: it did not say
};

// Takes at most some ten seconds. A Failure when the HTTP library does not work at all.
ServerAnswer probeServer(const std::string& url);
