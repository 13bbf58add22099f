#include "SettingsFile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstdio>
#include <fstream>
#include <iterator>

#include "ErrnoCode.h"
#include "platform/error.h"
#include "platform/log.h"
#include "platform/root.h"

namespace platform::settings {

namespace {

constexpr std::string_view kFolder = "/opt/usr/data/settings/";
constexpr std::string_view kAreas[] = {"db", "file", "memory"};
constexpr std::string_view kNameCharacters =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789._-";
constexpr const char* kTag = "PLATFORM_SETTINGS";

bool isMemory(std::string_view key) {
    return key.starts_with("memory/");
}

const std::string& bootId() {
    static const std::string* const id = [] {
        std::ifstream file("/proc/sys/kernel/random/boot_id");
        auto* text = new std::string;
        file >> *text;
        return text;
    }();
    return *id;
}

std::string contentOf(const std::string& key, const Value& value) {
    const std::string text = value.type == VCONF_TYPE_STRING ? value.text : std::to_string(value.number);
    return std::to_string(value.type) + " " + (isMemory(key) ? bootId() : "-") + "\n" + text;
}

// Nothing when the content is damaged; a value of type none when it belongs to another boot.
std::optional<Value> parse(const std::string& key, const std::string& content) {
    const size_t blank = content.find(' ');
    const size_t end = content.find('\n');
    if (blank == std::string::npos || end == std::string::npos || blank > end) return std::nullopt;
    int type = 0;
    std::from_chars(content.data(), content.data() + blank, type);
    if (isMemory(key) && content.substr(blank + 1, end - blank - 1) != bootId()) return Value{};
    Value value;
    value.text = content.substr(end + 1);
    if (type == VCONF_TYPE_STRING) {
        value.type = VCONF_TYPE_STRING;
        return value;
    }
    if (type != VCONF_TYPE_INT && type != VCONF_TYPE_BOOL) return std::nullopt;
    value.type = static_cast<vconf_type_e>(type);
    const char* last = value.text.data() + value.text.size();
    const auto [rest, error] = std::from_chars(value.text.data(), last, value.number);
    if (error != std::errc() || rest != last) return std::nullopt;
    return value;
}

bool readAll(int fd, std::string* content) {
    char chunk[4096];
    for (;;) {
        const ssize_t count = ::read(fd, chunk, sizeof chunk);
        if (count < 0 && errno == EINTR) continue;
        if (count <= 0) return count == 0;
        content->append(chunk, static_cast<size_t>(count));
    }
}

}  // namespace

bool isValidKey(std::string_view key) {
    const std::string_view area = key.substr(0, key.find('/'));
    if (area.size() == key.size() ||
        std::find(std::begin(kAreas), std::end(kAreas), area) == std::end(kAreas))
        return false;
    for (size_t begin = 0; begin <= key.size();) {
        const size_t end = std::min(key.find('/', begin), key.size());
        const std::string_view part = key.substr(begin, end - begin);
        // A leading dot is left to the temporary files of a write.
        if (part.empty() || part.front() == '.' || part.size() > 200) return false;
        if (part.find_first_not_of(kNameCharacters) != std::string_view::npos) return false;
        begin = end + 1;
    }
    return true;
}

std::string fileOf(const std::string& key) {
    return rootedPath(std::string(kFolder) + key);
}

std::string folderOf(const std::string& key) {
    return std::string(kFolder) + key.substr(0, key.rfind('/'));
}

std::optional<Value> read(const std::string& key) {
    const int fd = open(fileOf(key).c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
    if (fd == -1) return std::nullopt;
    std::string content;
    struct stat info {};
    // A folder of longer keys is no key, and nothing but a plain file is read.
    const bool isFile = fstat(fd, &info) == 0 && S_ISREG(info.st_mode);
    const bool isWhole = isFile && readAll(fd, &content);
    close(fd);
    if (!isFile) return std::nullopt;
    if (!isWhole) {
        dlog_print(DLOG_ERROR, kTag, "the file of %s cannot be read, the key counts as unset", key.c_str());
        return std::nullopt;
    }
    std::optional<Value> value = parse(key, content);
    if (!value)
        dlog_print(DLOG_ERROR, kTag, "the file of %s is damaged, the key counts as unset", key.c_str());
    if (value && value->type == VCONF_TYPE_NONE) return std::nullopt;
    return value;
}

int write(const std::string& key, const Value& value) {
    if (const int code = makeFolder(folderOf(key)); code != PLATFORM_ERROR_NONE) return code;
    constexpr unsigned kMode = 0644;
    const bool isDone = replaceFile(fileOf(key), contentOf(key, value), kMode, /*isDurable=*/!isMemory(key));
    return isDone ? PLATFORM_ERROR_NONE : codeOfErrno(errno);
}

int remove(const std::string& key) {
    if (unlink(fileOf(key).c_str()) == 0 || errno == ENOENT || errno == ENOTDIR) return PLATFORM_ERROR_NONE;
    return codeOfErrno(errno);
}

}  // namespace platform::settings
