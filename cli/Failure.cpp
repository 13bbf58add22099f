#include "Failure.h"

#include <string_view>

#include "platform/error.h"

namespace {

struct Reason {
    int code;
    std::string_view text;
};
constexpr Reason kReasons[] = {
    {PLATFORM_ERROR_NOT_FOUND, "there is no such thing"},
    {PLATFORM_ERROR_IO, "a file could not be read or written; check the root folder and its disk"},
    {PLATFORM_ERROR_PERMISSION_DENIED,
     "permission denied; run it as the owner of the root folder, or on a system install as root (for records "
     "also as a "
     "member of the group vantor-pim-sync)"},
    {PLATFORM_ERROR_INVALID_PARAMETER, "the value was refused"},
    {PLATFORM_ERROR_NO_SPACE, "the disk is full; make room and try again"},
    {PLATFORM_ERROR_DATABASE, "the database could not be read or written; check its file and its folder"},
    {PLATFORM_ERROR_NEWER,
     "it was written by a newer version of this software and is left alone; install that version again"},
    {PLATFORM_ERROR_CONFLICT, "another program keeps changing it; try again"},
    {PLATFORM_ERROR_TIMED_OUT, "no answer in time; try again"},
};
constexpr std::string_view kUnknownReason = "an internal error, the log above may tell more";

}  // namespace

void check(int code, const std::string& what) {
    if (code == PLATFORM_ERROR_NONE) return;
    std::string_view text = kUnknownReason;
    for (const Reason& reason : kReasons) {
        if (reason.code == code) text = reason.text;
    }
    throw Failure(what + ": " + std::string(text));
}
