#include "exchange/ContentLine.h"

#include <algorithm>
#include <array>

namespace exchange {

std::string ContentLine::parameter(std::string_view wanted) const {
    for (const Parameter& one : parameters) {
        if (one.name == wanted && !one.values.empty()) return one.values.front();
    }
    return {};
}

namespace content_line {

namespace {

constexpr size_t kMostOctets = 75;
constexpr std::string_view kLineEnd = "\r\n";
constexpr std::string_view kFold = "\r\n ";
constexpr std::array<std::string_view, 4> kBareEncodings = {"QUOTED-PRINTABLE", "BASE64", "8BIT", "7BIT"};

// Characters that a parameter cannot hold, as "^" and a letter.
struct Caret {
    char plain;
    char letter;
};
constexpr Caret kCarets[] = {{'^', '^'}, {'\n', 'n'}, {'"', '\''}};

bool isControl(char c) {
    return (static_cast<unsigned char>(c) < 0x20 && c != '\t') || c == 0x7F;
}

std::string caretDecoded(std::string_view text) {
    std::string out;
    for (size_t at = 0; at < text.size(); ++at) {
        const Caret* found = nullptr;
        for (const Caret& row : kCarets) {
            if (text[at] == '^' && at + 1 < text.size() && text[at + 1] == row.letter) found = &row;
        }
        out += found != nullptr ? found->plain : text[at];
        if (found != nullptr) ++at;
    }
    return out;
}

std::string caretEncoded(std::string_view text) {
    std::string out;
    for (const char c : text) {
        const auto* found = std::find_if(std::begin(kCarets), std::end(kCarets),
                                         [c](const Caret& row) { return row.plain == c; });
        if (found != std::end(kCarets)) {
            out += {'^', found->letter};
        } else if (!isControl(c)) {
            out += c;
        }
    }
    const bool needsQuotes = out.find_first_of(":;, ") != std::string::npos;
    return needsQuotes ? "\"" + out + "\"" : out;
}

// Reads one value of a parameter, quoted or not, and moves `rest` behind it.
bool takeValue(std::string_view& rest, std::string* out) {
    if (rest.starts_with('"')) {
        const size_t end = rest.find('"', 1);
        if (end == std::string_view::npos) return false;
        *out = caretDecoded(rest.substr(1, end - 1));
        rest.remove_prefix(end + 1);
        return true;
    }
    const size_t end = rest.find_first_of(",;:");
    if (end == std::string_view::npos) return false;
    *out = caretDecoded(rest.substr(0, end));
    rest.remove_prefix(end);
    return true;
}

Parameter bareWord(std::string_view word) {
    std::string name = upper(word);
    const bool isEncoding =
        std::find(kBareEncodings.begin(), kBareEncodings.end(), name) != kBareEncodings.end();
    return {isEncoding ? "ENCODING" : "TYPE", {std::move(name)}};
}

// What stands behind a ";": "NAME=VALUE,VALUE" or a word.
bool takeParameter(std::string_view& rest, ContentLine& line) {
    const size_t end = rest.find_first_of("=;:");
    if (end == std::string_view::npos) return false;
    const std::string_view name = rest.substr(0, end);
    const bool hasValue = rest[end] == '=';
    rest.remove_prefix(hasValue ? end + 1 : end);
    if (!hasValue) {
        if (!name.empty()) line.parameters.push_back(bareWord(name));
        return true;
    }
    Parameter parameter{upper(name), {}};
    for (;;) {
        std::string value;
        if (!takeValue(rest, &value)) return false;
        parameter.values.push_back(std::move(value));
        if (!rest.starts_with(',')) break;
        rest.remove_prefix(1);
    }
    line.parameters.push_back(std::move(parameter));
    return true;
}

}  // namespace

std::string upper(std::string_view text) {
    std::string out(text);
    std::transform(out.begin(), out.end(), out.begin(),
                   [](char c) { return c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c; });
    return out;
}

std::string lower(std::string_view text) {
    std::string out(text);
    std::transform(out.begin(), out.end(), out.begin(),
                   [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; });
    return out;
}

bool isName(std::string_view text) {
    constexpr size_t kLongest = 64;
    return !text.empty() && text.size() <= kLongest && std::all_of(text.begin(), text.end(), [](char c) {
        return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '-' ||
               c == '_';
    });
}

std::optional<ContentLine> parse(std::string_view text) {
    const size_t end = text.find_first_of(";:");
    if (end == std::string_view::npos) return std::nullopt;
    ContentLine line;
    std::string_view name = text.substr(0, end);
    if (const size_t dot = name.rfind('.'); dot != std::string_view::npos) {
        line.group = lower(name.substr(0, dot));
        name.remove_prefix(dot + 1);
    }
    if (!isName(name)) return std::nullopt;
    line.name = upper(name);
    text.remove_prefix(end);
    while (text.starts_with(';')) {
        text.remove_prefix(1);
        if (!takeParameter(text, line)) return std::nullopt;
    }
    if (!text.starts_with(':')) return std::nullopt;
    line.value = text.substr(1);
    return line;
}

std::string compose(const ContentLine& line) {
    std::string text = line.group.empty() ? line.name : line.group + "." + line.name;
    for (const Parameter& parameter : line.parameters) {
        text += ";" + parameter.name;
        char separator = '=';
        for (const std::string& value : parameter.values) {
            text += separator + caretEncoded(value);
            separator = ',';
        }
    }
    text += ":" + line.value;
    std::string folded;
    folded.reserve(text.size() + text.size() / kMostOctets * kFold.size() + kLineEnd.size());
    // A line that goes on begins with a blank, which counts.
    for (size_t at = 0, room = kMostOctets; at < text.size(); room = kMostOctets - 1) {
        size_t end = std::min(at + room, text.size());
        while (end < text.size() && end > at + 1 && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80)
            --end;
        folded.append(text, at, end - at);
        at = end;
        folded += at < text.size() ? kFold : kLineEnd;
    }
    return folded;
}

std::string escape(std::string_view text) {
    std::string out;
    out.reserve(text.size());
    for (size_t at = 0; at < text.size(); ++at) {
        const char c = text[at];
        const bool isFirstOfPair = c == '\r' && at + 1 < text.size() && text[at + 1] == '\n';
        if (isFirstOfPair) continue;
        if (c == '\n' || c == '\r') {
            out += "\\n";
        } else if (c == '\\' || c == ';' || c == ',') {
            out += {'\\', c};
        } else if (!isControl(c)) {
            out += c;
        }
    }
    return out;
}

std::string unescape(std::string_view value) {
    std::string out;
    out.reserve(value.size());
    for (size_t at = 0; at < value.size(); ++at) {
        const char next = value[at] == '\\' && at + 1 < value.size() ? value[at + 1] : '\0';
        if (next == 'n' || next == 'N') {
            out += '\n';
        } else if (next != '\0' && std::string_view("\\;,:\"").find(next) != std::string_view::npos) {
            out += next;
        } else {
            out += value[at];
            continue;
        }
        ++at;
    }
    return out;
}

std::vector<std::string_view> split(std::string_view value, char separator) {
    std::vector<std::string_view> parts;
    size_t start = 0;
    for (size_t at = 0; at < value.size(); ++at) {
        if (value[at] == '\\') {
            ++at;
        } else if (value[at] == separator) {
            parts.push_back(value.substr(start, at - start));
            start = at + 1;
        }
    }
    parts.push_back(value.substr(std::min(start, value.size())));
    return parts;
}

bool losesControls(std::string_view text) {
    return std::any_of(text.begin(), text.end(), [](char c) { return c != '\n' && isControl(c); });
}

}  // namespace content_line

}  // namespace exchange
