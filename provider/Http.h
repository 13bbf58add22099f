// What passes between the HTTP front and the services: a request as the services see it, a reply, an error.
#pragma once

#include <functional>
#include <map>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace provider {

// Members keep the order in which they were written, as clients of a real service see them.
using Json = nlohmann::ordered_json;

// ApiError: thrown by services and checks, turned into the provider's error body by the dispatcher alone.
struct ApiError {
    int status = 400;
    std::string reason;    // "invalid", "notFound", ...
    std::string message;   // for people
    std::string location;  // member or parameter at fault; empty: none
};

// Throws the ApiError 400 of a member that is not as it must be; `why` is for people.
[[noreturn]] void invalid(const std::string& member, const std::string& why = "");
// A member that is a text; fallback when it is not there. Throws ApiError for any other value.
std::string textOf(const Json& object, const char* name, const std::string& fallback = "");

// {"error":{"errors":[{"domain","reason","message"}],"code","message"}}
std::string errorBody(const ApiError& error);

struct Call {
    std::string method;
    std::string path;              // still percent-encoded, without query
    std::string target;            // path and query as sent
    std::vector<std::string> ids;  // what stands at the "*" of the route, decoded
    std::multimap<std::string, std::string> query;
    std::string body;
    std::string origin;                              // scheme and host, as the client addressed them
    std::string account;                             // e-mail of the token's owner; empty on open routes
    std::function<std::string(const char*)> header;  // "" when absent

    // The parameter's last value, or fallback.
    [[nodiscard]] std::string param(const std::string& name, const std::string& fallback = "") const;
    // A whole number from low upwards. Throws ApiError.
    [[nodiscard]] long long number(const std::string& name, long long fallback, long long low) const;
    // Throws ApiError for a parameter that is not in known.
    void allowOnly(std::initializer_list<std::string_view> known) const;
};

struct Reply {
    int status = 200;
    std::string body;
    // With its charset on purpose: the server library compresses "application/json" on its own account.
    std::string contentType = "application/json; charset=UTF-8";
    std::map<std::string, std::string> headers;
};

Reply jsonReply(const Json& body, int status = 200);
// Of a service that has nothing to tell: an empty object.
Reply done();

// Throws 400 without a body, 413 above the limit, 415 when the content type is another one or not in UTF-8.
void requireBody(const Call& call, std::string_view wantedMedia);
// The content type of a body that is an image. Throws 400 without a body, 413 above 10 MB, 415 for other content.
std::string imageType(const Call& call);
// The body as a JSON object. Throws 400 without a body or with a bad one, 413 above the limit, 415 when the
// content type is not JSON.
Json jsonBody(const Call& call);

std::vector<std::string> splitText(std::string_view text, char separator);
// Percent-decoding of one path segment; malformed escapes stay as they are.
std::string decodeSegment(std::string_view text);

}  // namespace provider
