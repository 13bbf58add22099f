// init: everything that a root folder needs.
#include "Command.h"
#include "Device.h"
#include "Failure.h"
#include "Output.h"
#include "platform/root.h"

Action buildInit(CLI::App&) {
    return [] {
        device::prepare();
        const std::string root = platform::rootFolder();
        output::line((root.empty() ? "The device" : root) + " is ready");
        return kExitDone;
    };
}
