#include "calendar/CalListInfo.h"

std::string CalListInfo::jsonText() const {
    if (!json) return {};
    const JsonGeneratorPtr generator(json_generator_new());
    json_generator_set_root(generator.get(), json.get());
    const GChars text(json_generator_to_data(generator.get(), nullptr));
    return text ? std::string(text.get()) : std::string();
}
