#include "exchange/VCardValues.h"

#include <glib.h>

#include <algorithm>

#include "Handles.h"
#include "TimeText.h"
#include "exchange/VCardMapping.h"

namespace exchange::vcard_values {

namespace {

constexpr std::string_view kQuotedPrintable = "QUOTED-PRINTABLE";
constexpr std::string_view kCommonBegin = "_$!<";
constexpr std::string_view kCommonEnd = ">!$_";
constexpr std::string_view kLinks[] = {"http:", "https:", "urn:", "file:", "cid:", "geo:"};

std::string quotedPrintable(std::string_view text) {
    std::string out;
    for (size_t at = 0; at < text.size(); ++at) {
        const int high = text[at] == '=' && at + 2 < text.size() ? g_ascii_xdigit_value(text[at + 1]) : -1;
        const int low = high >= 0 ? g_ascii_xdigit_value(text[at + 2]) : -1;
        out += low >= 0 ? static_cast<char>(high * 16 + low) : text[at];
        if (low >= 0) at += 2;
    }
    for (size_t at = 0; (at = out.find("\r\n", at)) != std::string::npos;) out.erase(at, 1);
    return out;
}

bool isText(const std::string& text) {
    return g_utf8_validate(text.data(), static_cast<gssize>(text.size()), nullptr) != FALSE;
}

// The bytes of a base64 text; nothing when it is none.
std::optional<std::string> fromBase64(std::string_view text) {
    std::string plain;
    plain.reserve(text.size() + 4);
    for (const char c : text) {
        if (c == ' ' || c == '\t') continue;
        if (g_ascii_isalnum(c) == 0 && c != '+' && c != '/' && c != '=') return std::nullopt;
        plain += c;
    }
    while (plain.size() % 4 != 0) plain += '=';
    gsize size = 0;
    g_base64_decode_inplace(plain.data(), &size);
    plain.resize(size);
    return plain;
}

}  // namespace

bool decode(ContentLine& line) {
    if (content_line::upper(line.parameter("ENCODING")) == kQuotedPrintable)
        line.value = quotedPrintable(line.value);
    const std::string charset = content_line::upper(line.parameter("CHARSET"));
    if (!charset.empty() && charset != "UTF-8" && !isText(line.value)) {
        gsize size = 0;
        const GChars converted(g_convert(line.value.data(), static_cast<gssize>(line.value.size()), "UTF-8",
                                         charset.c_str(), nullptr, &size, nullptr));
        if (converted == nullptr) return false;
        line.value.assign(converted.get(), size);
    }
    const bool areParametersText = std::all_of(
        line.parameters.begin(), line.parameters.end(),
        [](const Parameter& one) { return std::all_of(one.values.begin(), one.values.end(), isText); });
    return areParametersText && isText(line.value);
}

std::vector<std::string> typesOf(const ContentLine& line) {
    std::vector<std::string> types;
    for (const Parameter& parameter : line.parameters) {
        if (parameter.name != "TYPE") continue;
        for (const std::string& value : parameter.values) {
            for (const std::string_view word : content_line::split(value, ','))
                if (!word.empty()) types.push_back(content_line::upper(word));
        }
    }
    return types;
}

std::string commonLabel(const std::string& label) {
    if (!label.starts_with(kCommonBegin) || !label.ends_with(kCommonEnd)) return {};
    if (label.size() <= kCommonBegin.size() + kCommonEnd.size()) return {};
    return label.substr(kCommonBegin.size(), label.size() - kCommonBegin.size() - kCommonEnd.size());
}

std::string joined(std::string_view list, std::string_view joint) {
    std::string text;
    bool isFirst = true;
    for (const std::string_view raw : content_line::split(list, ',')) {
        std::string part = content_line::unescape(raw);
        if (!isFirst) part.erase(0, part.find_first_not_of(' '));
        if (!isFirst && !part.empty() && !text.empty()) text += joint;
        text += part;
        isFirst = false;
    }
    return text;
}

std::string dateOf(const ContentLine& line) {
    if (content_line::lower(line.parameter("VALUE")) == "text") return {};
    if (!line.parameter("X-APPLE-OMIT-YEAR").empty()) return {};
    std::string text = line.value.substr(0, line.value.find_first_of("Tt "));
    if (text.size() == 10 && text[4] == '-' && text[7] == '-') std::erase(text, '-');
    const auto date = time_text::parseCompact(text);
    return date && time_text::isDate(*date) ? time_text::composeRfc3339(*date) : std::string();
}

std::optional<std::string> imageOf(const ContentLine& line) {
    std::string_view text = line.value;
    const std::string encoding = content_line::upper(line.parameter("ENCODING"));
    if (content_line::lower(text.substr(0, 5)) == "data:") {
        const size_t comma = text.find(',');
        if (comma == std::string_view::npos) return std::nullopt;
        if (!content_line::lower(text.substr(0, comma)).ends_with(";base64")) return std::nullopt;
        text.remove_prefix(comma + 1);
    } else if (encoding != "B" && encoding != "BASE64") {
        return std::nullopt;
    }
    auto bytes = fromBase64(text);
    if (bytes && bytes->empty()) return std::nullopt;
    return bytes;
}

bool isLink(std::string_view value) {
    const std::string start = content_line::lower(value.substr(0, 16));
    return std::any_of(std::begin(kLinks), std::end(kLinks),
                       [&](std::string_view link) { return start.starts_with(link); });
}

Messenger messengerOf(const ContentLine& line) {
    const std::string value = content_line::unescape(line.value);
    const size_t colon = value.find(':');
    const std::string scheme = colon != std::string::npos ? content_line::lower(value.substr(0, colon)) : "";
    const std::string rest = colon != std::string::npos ? value.substr(colon + 1) : value;
    const GChars plain(g_uri_unescape_string(rest.c_str(), nullptr));
    const bool isPlain = plain != nullptr && g_utf8_validate(plain.get(), -1, nullptr) != FALSE;
    Messenger messenger{isPlain ? plain.get() : rest, "", ""};
    const std::string service = content_line::upper(line.parameter("X-SERVICE-TYPE"));
    for (const CardMessenger& row : kMessengers) {
        if (messenger.protocol.empty() && row.scheme == scheme) messenger.protocol = row.protocol;
    }
    for (const CardMessenger& row : kMessengers) {
        if (!service.empty() && row.protocol == service) messenger.protocol = row.protocol;
    }
    if (!messenger.protocol.empty()) return messenger;
    messenger.label = !service.empty() ? line.parameter("X-SERVICE-TYPE") : scheme;
    messenger.protocol = messenger.label.empty() ? "other" : "custom";
    return messenger;
}

}  // namespace exchange::vcard_values
