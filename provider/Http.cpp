#include "Http.h"

#include <algorithm>
#include <charconv>

namespace provider {

namespace {

constexpr std::size_t kMaxBodyBytes = 4 << 20;
constexpr std::size_t kMaxImageBytes = 10 << 20;

int hexValue(char c) {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
}

// The content type in lower case, which is how its names compare.
std::string contentType(const Call& call) {
    std::string type = call.header("Content-Type");
    std::transform(type.begin(), type.end(), type.begin(), [](unsigned char c) { return std::tolower(c); });
    return type;
}

void checkSize(const Call& call, std::size_t limit) {
    if (call.body.empty()) throw ApiError{400, "required", "Required: a body", ""};
    if (call.body.size() > limit) throw ApiError{413, "uploadTooLarge", "Request is too large", ""};
}

}  // namespace

void invalid(const std::string& member, const std::string& why) {
    throw ApiError{400, "invalid", "Invalid value for: " + member + (why.empty() ? "" : ": " + why), member};
}

std::string textOf(const Json& object, const char* name, const std::string& fallback) {
    const auto found = object.find(name);
    if (found == object.end()) return fallback;
    if (!found->is_string()) invalid(name, "must be a string");
    return found->get<std::string>();
}

std::string errorBody(const ApiError& error) {
    Json entry = {{"domain", "global"}, {"reason", error.reason}, {"message", error.message}};
    if (!error.location.empty()) {
        entry["locationType"] = "parameter";
        entry["location"] = error.location;
    }
    Json body;
    body["error"]["errors"] = Json::array({entry});
    body["error"]["code"] = error.status;
    body["error"]["message"] = error.message;
    return body.dump(1, ' ', false, Json::error_handler_t::replace);
}

std::string Call::param(const std::string& name, const std::string& fallback) const {
    const auto range = query.equal_range(name);
    return range.first == range.second ? fallback : std::prev(range.second)->second;
}

long long Call::number(const std::string& name, long long fallback, long long low) const {
    if (query.count(name) == 0) return fallback;
    const std::string text = param(name);
    long long value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || end != text.data() + text.size() || value < low) {
        throw ApiError{400, "invalidParameter", "Invalid value '" + text + "' for " + name, name};
    }
    return value;
}

void Call::allowOnly(std::initializer_list<std::string_view> known) const {
    constexpr std::string_view kAlways[] = {"alt", "prettyPrint", "key", "quotaUser", "userIp"};
    for (const auto& [name, value] : query) {
        if (std::find(known.begin(), known.end(), name) == known.end() &&
            std::find(std::begin(kAlways), std::end(kAlways), name) == std::end(kAlways)) {
            throw ApiError{400, "invalidParameter", "Unknown or unsupported parameter: " + name, name};
        }
    }
}

Reply jsonReply(const Json& body, int status) {
    Reply reply;
    reply.status = status;
    reply.body = body.dump(-1, ' ', false, Json::error_handler_t::replace);
    return reply;
}

Reply done() {
    return jsonReply(Json::object());
}

void requireBody(const Call& call, std::string_view wantedMedia) {
    const std::string type = contentType(call);
    const std::string media = type.substr(0, type.find_first_of("; "));
    if (media != wantedMedia) {
        throw ApiError{415, "unsupportedMediaType", "Unsupported content type: '" + media + "'",
                       "Content-Type"};
    }
    const std::size_t charset = type.find("charset=");
    if (charset != std::string::npos && type.find("utf-8", charset) == std::string::npos) {
        throw ApiError{415, "unsupportedMediaType", "Only UTF-8 is accepted", "Content-Type"};
    }
    checkSize(call, kMaxBodyBytes);
}

std::string imageType(const Call& call) {
    std::string type = contentType(call);
    if (!type.starts_with("image/") || type == "image/")
        throw ApiError{415, "unsupportedMediaType", "Not an image: '" + type + "'", "Content-Type"};
    checkSize(call, kMaxImageBytes);
    return type;
}

Json jsonBody(const Call& call) {
    requireBody(call, "application/json");
    Json body = Json::parse(call.body, nullptr, false);
    if (body.is_discarded()) throw ApiError{400, "parseError", "Parse Error", ""};
    if (!body.is_object()) throw ApiError{400, "parseError", "The body must be a JSON object", ""};
    return body;
}

std::vector<std::string> splitText(std::string_view text, char separator) {
    std::vector<std::string> parts;
    std::size_t begin = 0;
    while (true) {
        const std::size_t end = text.find(separator, begin);
        parts.emplace_back(text.substr(begin, end - begin));
        if (end == std::string_view::npos) return parts;
        begin = end + 1;
    }
}

std::string decodeSegment(std::string_view text) {
    std::string out;
    out.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        const int high = text[i] == '%' && i + 2 < text.size() ? hexValue(text[i + 1]) : -1;
        const int low = high >= 0 ? hexValue(text[i + 2]) : -1;
        if (low >= 0) {
            out += static_cast<char>(high * 16 + low);
            i += 2;
        } else {
            out += text[i];
        }
    }
    return out;
}

}  // namespace provider
