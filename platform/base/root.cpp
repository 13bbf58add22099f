#include "platform/root.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstdlib>

#include "ErrnoCode.h"
#include "platform/error.h"

namespace platform {

std::string rootFolder() {
    const char* value = std::getenv("VANTOR_PIM_SYNC_ROOT");
    std::string root = value != nullptr ? value : "";
    while (!root.empty() && root.back() == '/') root.pop_back();
    return root;
}

std::string rootedPath(std::string_view absolute) {
    return rootFolder().append(absolute);
}

int makeFolder(std::string_view absolute, unsigned mode) {
    const std::string path = rootedPath(absolute);
    for (size_t end = path.find('/', 1);; end = path.find('/', end + 1)) {
        const bool last = end == std::string::npos;
        const std::string part = path.substr(0, end);
        if (mkdir(part.c_str(), last ? mode : 0755) != 0 && errno != EEXIST) return codeOfErrno(errno);
        if (last) break;
    }
    struct stat info {};
    if (stat(path.c_str(), &info) != 0) return codeOfErrno(errno);
    return S_ISDIR(info.st_mode) ? PLATFORM_ERROR_NONE : PLATFORM_ERROR_IO;
}

}  // namespace platform
