// key: secrets of the device. A value comes from standard input only and is never printed.
#include "Command.h"
#include "Failure.h"
#include "InputFile.h"
#include "platform/error.h"
#include "platform/keys.h"

Action buildKeySet(CLI::App& app) {
    auto name = std::make_shared<std::string>();
    app.add_option("NAME", *name, "Name of the key: letters, digits, '.', '_' and '-'")->required();
    return [name] {
        const std::string value = input_file::readSecret("-", "the key's value");
        const int code = key_storage_set(name->c_str(), value.c_str());
        if (code == PLATFORM_ERROR_INVALID_PARAMETER) throw Misuse("\"" + *name + "\" is no name of a key");
        check(code, "storing the key " + *name);
        return kExitDone;
    };
}
