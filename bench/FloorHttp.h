// FloorHttp: one libcurl handle, and JSON as json-glib reads it. Nothing is repeated; a failure throws std::runtime_error.
#pragma once

#include <string>

#include "common/Handles.h"

namespace bench {

class FloorHttp {
public:
    // `base` without a trailing slash. Peers are not verified, as the daemon does it.
    explicit FloorHttp(std::string base);

    // Asks for an access token, which all later requests carry.
    void logIn();
    // `address`: a path below the base, or a whole URL. The answer must be 2xx.
    JsonNodePtr get(const std::string& address);
    JsonNodePtr post(const std::string& path, const std::string& body);
    [[nodiscard]] long requests() const { return mRequests; }

private:
    JsonNodePtr perform(const std::string& address);

    const std::string mBase;
    const CurlEasy mCurl;
    const JsonParserPtr mParser;
    CurlList mHeaders;
    std::string mBody;
    long mRequests = 0;
};

// Text of a member, "" for none.
std::string textOf(JsonObject* object, const char* member);

}  // namespace bench
