// Context: what the services of one provider share. Outlives them; each part guards itself.
#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>

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
    // Counts requests that may have changed the content, so that a reader learns whether to look again.
    std::atomic<std::uint64_t> changes{0};
    // Tells one run of the provider from the next, whose counts begin anew.
    const std::string run = std::to_string(std::chrono::system_clock::now().time_since_epoch().count());
};

}  // namespace provider
