// pims_ipc_data_s: the items of one request or reply.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "platform/ipc.h"

struct pims_ipc_data_s {
    std::vector<std::string> items;  // a string's buffer is aligned for any integer
    size_t next = 0;
    size_t frameBytes = 0;
};

namespace platform::ipc {

inline constexpr size_t kLengthBytes = sizeof(uint32_t);

// What a reply says before its data.
enum class ReplyStatus : uint32_t { kData = 0, kNoData = 1, kUnknown = 2 };

void appendUint32(std::string* out, uint32_t value);
// A whole frame: length, sequence, items.
std::string composeFrame(uint32_t sequence, const std::vector<std::string_view>& head,
                         const pims_ipc_data_s* data);

// Cuts a frame's payload (without its length) into sequence and items; false when it breaks the format or a limit.
bool parseFrame(std::string_view payload, uint32_t* sequence, std::vector<std::string>* items);

// Takes whole frames off the front of a stream's bytes.
enum class Cut { kFrame, kIncomplete, kBroken };
Cut cutFrame(std::string* bytes, std::string* payload);

}  // namespace platform::ipc
