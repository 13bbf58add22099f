#include "common/JsonText.h"

#include <vector>

#include "common/JsonSyntax.h"

namespace json_text {

namespace {

// The text with the character for what cannot be shown in place of each escape that `lone` tells.
std::string repaired(std::string_view text, const std::vector<size_t>& lone) {
    constexpr std::string_view kReplacement = "\\uFFFD";
    std::string copy(text);
    for (const size_t at : lone) copy.replace(at, kReplacement.size(), kReplacement);
    return copy;
}

// The generator leaves one of the control characters as it is, and writes ".0" behind an exponent ("1e+22.0").
std::string corrected(std::string_view text) {
    constexpr char kUnescaped = '\x1F';
    constexpr std::string_view kFraction = ".0";
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
    std::vector<size_t> lone;
    if (!json_syntax::isValid(text, &lone)) return nullptr;
    // The parser makes broken UTF-8 of half a pair, drops what follows, or refuses the document for it.
    if (!lone.empty()) return parse(repaired(text, lone));
    const JsonParserPtr parser(json_parser_new());
    if (!parser || json_parser_load_from_data(parser.get(), text.data(), static_cast<gssize>(text.size()),
                                              nullptr) == FALSE) {
        return nullptr;
    }
    return JsonNodePtr(json_parser_steal_root(parser.get()));
}

std::string textOf(JsonNode* node) {
    if (node == nullptr) return {};
    const JsonGeneratorPtr generator(json_generator_new());
    json_generator_set_root(generator.get(), node);
    const GChars text(json_generator_to_data(generator.get(), nullptr));
    return text ? corrected(text.get()) : std::string();
}

}  // namespace json_text
