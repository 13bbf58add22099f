#include "common/JsonText.h"

#include "common/JsonReader.h"

namespace json_text {

namespace {

// The generator leaves one of the control characters as it is, and writes ".0" behind an exponent ("1e+22.0").
std::string corrected(std::string_view text) {
    constexpr char kUnescaped = '\x1F';
    constexpr std::string_view kFraction = ".0";
    constexpr auto kNowhere = std::string_view::npos;
    if (text.find(kUnescaped) == kNowhere && text.find("e+") == kNowhere && text.find("e-") == kNowhere)
        return std::string(text);
    std::string out;
    out.reserve(text.size());
    bool isInString = false;
    bool isExponent = false;
    for (size_t i = 0; i < text.size(); ++i) {
        const char c = text[i];
        if (isExponent && text.substr(i, kFraction.size()) == kFraction) {
            i += kFraction.size() - 1;
            continue;
        }
        if (c == kUnescaped) {
            out += "\\u001f";
            continue;
        }
        out += c;
        if (isInString && c == '\\') {
            out += text[++i];
        } else if (c == '"') {
            isInString = !isInString;
        } else if (!isInString && c == 'e' && g_ascii_isdigit(text[i - 1])) {
            isExponent = true;
        } else if (isExponent) {
            isExponent = c == '+' || c == '-' || g_ascii_isdigit(c);
        }
    }
    return out;
}

}  // namespace

JsonNodePtr parse(std::string_view text) {
    return json_reader::read(text);
}

std::string textOf(JsonNode* node) {
    if (node == nullptr) return {};
    const JsonGeneratorPtr generator(json_generator_new());
    json_generator_set_root(generator.get(), node);
    const GChars text(json_generator_to_data(generator.get(), nullptr));
    return text ? corrected(text.get()) : std::string();
}

}  // namespace json_text
