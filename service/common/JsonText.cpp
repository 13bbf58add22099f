#include "common/JsonText.h"

#include "common/JsonSyntax.h"

namespace json_text {

JsonNodePtr parse(std::string_view text) {
    if (!json_syntax::isValid(text)) return nullptr;
    const JsonParserPtr parser(json_parser_new_immutable());
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
    return text ? std::string(text.get()) : std::string();
}

}  // namespace json_text
