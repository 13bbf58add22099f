// setting: the device's settings store. The type of a value follows from how it is written.
#include <algorithm>

#include "Command.h"
#include "Failure.h"
#include "Output.h"
#include "platform/error.h"
#include "platform/settings.h"

namespace {

struct Options {
    std::string key;
    std::string value;
    bool isJson = false;
};

void checkKey(int code, const std::string& key) {
    if (code == PLATFORM_ERROR_INVALID_PARAMETER) {
        throw Misuse("\"" + key + "\" is no key; keys begin with db/, file/ or memory/");
    }
}

Json read(const std::string& key) {
    int number = 0;
    bool flag = false;
    std::string text;
    const auto done = [&key](int code) { check(code, "reading the setting " + key); };
    switch (vconf_get_type(key.c_str())) {
        case VCONF_TYPE_INT:
            done(vconf_get_int(key.c_str(), &number));
            return number;
        case VCONF_TYPE_BOOL:
            done(vconf_get_bool(key.c_str(), &flag));
            return flag;
        case VCONF_TYPE_STRING:
            done(vconf_get_str(key.c_str(), &text));
            return text;
        case VCONF_TYPE_NONE:
            break;
    }
    checkKey(vconf_get_int(key.c_str(), &number), key);
    throw Failure("the setting " + key + " is not set; set it with: vantor-pim-syncctl setting set " + key +
                  " VALUE");
}

bool isWholeNumber(const std::string& text) {
    const size_t digits = text.starts_with('-') ? 1 : 0;
    return text.size() > digits && std::all_of(text.begin() + static_cast<std::ptrdiff_t>(digits), text.end(),
                                               [](char c) { return c >= '0' && c <= '9'; });
}

int write(const std::string& key, const std::string& value) {
    if (value == "true" || value == "false") return vconf_set_bool(key.c_str(), value == "true");
    if (!isWholeNumber(value)) return vconf_set_str(key.c_str(), value.c_str());
    int number = 0;
    if (!command::readNumber(value, INT32_MIN, INT32_MAX, &number)) {
        throw Failure(value + " is too large for a setting; numbers have 32 bits");
    }
    return vconf_set_int(key.c_str(), number);
}

}  // namespace

Action buildSettingGet(CLI::App& app) {
    auto options = std::make_shared<Options>();
    app.add_option("KEY", options->key, "Key of the setting")->required();
    command::addJson(app, options->isJson);
    return [options] {
        const Json value = read(options->key);
        if (options->isJson) {
            output::json({{"key", options->key}, {"value", value}});
        } else {
            output::line(value.is_string() ? value.get<std::string>() : value.dump());
        }
        return kExitDone;
    };
}

Action buildSettingSet(CLI::App& app) {
    auto options = std::make_shared<Options>();
    app.add_option("KEY", options->key, "Key of the setting")->required();
    app.add_option("VALUE", options->value, "Whole number, true, false, or a text");
    app.allow_extras();  // a negative number looks like an option
    return [options, &app] {
        std::vector<std::string> values = app.remaining();
        for (const std::string& text : values) {
            if (!isWholeNumber(text)) throw Misuse("\"" + text + "\" is not expected (see --help)");
        }
        if (app.count("VALUE") > 0) values.push_back(options->value);
        if (values.size() != 1) throw Misuse("setting set takes a KEY and one VALUE (see --help)");
        const int code = write(options->key, values.front());
        checkKey(code, options->key);
        check(code, "storing the setting " + options->key);
        return kExitDone;
    };
}
