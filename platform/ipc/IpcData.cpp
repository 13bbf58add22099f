#include "IpcData.h"

#include <bit>
#include <cstring>

#include "platform/error.h"

static_assert(std::endian::native == std::endian::little, "frames carry little-endian numbers");

namespace platform::ipc {

namespace {

bool takeUint32(std::string_view* bytes, uint32_t* value) {
    if (bytes->size() < sizeof *value) return false;
    std::memcpy(value, bytes->data(), sizeof *value);
    bytes->remove_prefix(sizeof *value);
    return true;
}

}  // namespace

void appendUint32(std::string* out, uint32_t value) {
    char bytes[sizeof value];
    std::memcpy(bytes, &value, sizeof value);
    out->append(bytes, sizeof bytes);
}

std::string composeFrame(uint32_t sequence, const std::vector<std::string_view>& head,
                         const pims_ipc_data_s* data) {
    std::string payload;
    appendUint32(&payload, sequence);
    const auto appendItem = [&payload](std::string_view item) {
        appendUint32(&payload, static_cast<uint32_t>(item.size()));
        payload.append(item);
    };
    for (const std::string_view item : head) appendItem(item);
    if (data != nullptr) {
        for (const std::string& item : data->items) appendItem(item);
    }
    std::string frame;
    frame.reserve(kLengthBytes + payload.size());
    appendUint32(&frame, static_cast<uint32_t>(payload.size()));
    return frame + payload;
}

bool parseFrame(std::string_view payload, uint32_t* sequence, std::vector<std::string>* items) {
    std::string_view rest = payload;
    uint32_t number = 0;
    if (!takeUint32(&rest, &number)) return false;
    std::vector<std::string> found;
    while (!rest.empty()) {
        uint32_t size = 0;
        if (!takeUint32(&rest, &size) || size > kMaxItemBytes || size > rest.size()) return false;
        found.emplace_back(rest.substr(0, size));
        rest.remove_prefix(size);
    }
    *sequence = number;
    *items = std::move(found);
    return true;
}

Cut cutFrame(std::string* bytes, std::string* payload) {
    std::string_view rest(*bytes);
    uint32_t length = 0;
    if (!takeUint32(&rest, &length)) return Cut::kIncomplete;
    if (length > kMaxFrameBytes) return Cut::kBroken;
    if (rest.size() < length) return Cut::kIncomplete;
    payload->assign(rest.substr(0, length));
    bytes->erase(0, kLengthBytes + length);
    return Cut::kFrame;
}

}  // namespace platform::ipc

pims_ipc_data_h pims_ipc_data_create_with_size(size_t size, int flags) {
    if (flags != 0 || size > kMaxFrameBytes) return nullptr;
    return new pims_ipc_data_s;
}

void pims_ipc_data_destroy(pims_ipc_data_h data) {
    delete data;
}

int pims_ipc_data_put(pims_ipc_data_h data, const void* value, size_t size) {
    if (data == nullptr || (value == nullptr && size > 0) || size > kMaxItemBytes)
        return PLATFORM_ERROR_INVALID_PARAMETER;
    const size_t grown = data->frameBytes + platform::ipc::kLengthBytes + size;
    // Room is kept for the sequence and the names or status in front of the data.
    constexpr size_t kHeadBytes = 1024;
    if (grown > kMaxFrameBytes - kHeadBytes) return PLATFORM_ERROR_INVALID_PARAMETER;
    data->items.emplace_back(static_cast<const char*>(value), size);
    data->frameBytes = grown;
    return PLATFORM_ERROR_NONE;
}

void* pims_ipc_data_get(pims_ipc_data_h data, size_t* size) {
    if (data == nullptr || size == nullptr || data->next >= data->items.size()) return nullptr;
    std::string& item = data->items[data->next++];
    *size = item.size();
    return item.data();
}
