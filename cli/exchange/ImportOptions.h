// ImportOptions.h: how a file is imported.
#pragma once

#include <string>

struct ImportOptions {
    std::string file;
    std::string timeZone;  // of times that name none; "" for the machine's
    int calendar = 0;
    int account = 0;
    bool replaces = false;
    bool isDryRun = false;
    bool isJson = false;
};
