// A client's bytes on the service socket: frames, items, and the arguments of the calls.
#include <memory>
#include <string_view>
#include <vector>

#include "../../platform/ipc/IpcData.h"
#include "common/vantor_pim_sync_ipc_marshal.h"
#include "fuzz/Fuzz.h"

using fuzz::require;
using platform::ipc::Cut;

namespace {

struct DestroyData {
    void operator()(pims_ipc_data_s* data) const noexcept { pims_ipc_data_destroy(data); }
};
using Data = std::unique_ptr<pims_ipc_data_s, DestroyData>;
struct FreeAccount {
    void operator()(vantor_pim_sync_account_s* account) const noexcept {
        vantor_pim_sync_free_account(account);
    }
};
using AccountRecord = std::unique_ptr<vantor_pim_sync_account_s, FreeAccount>;

// The payloads of a stream that arrives in pieces of `step` bytes; how it ends goes to *last.
std::vector<std::string> payloadsOf(std::string_view stream, size_t step, Cut* last) {
    std::vector<std::string> payloads;
    std::string input;
    while (!stream.empty()) {
        input.append(stream.substr(0, step));
        stream.remove_prefix(std::min(step, stream.size()));
        std::string payload;
        while ((*last = platform::ipc::cutFrame(&input, &payload)) == Cut::kFrame)
            payloads.push_back(payload);
        if (*last == Cut::kBroken) break;
    }
    return payloads;
}

Data dataOf(const std::vector<std::string>& items) {
    Data data(new pims_ipc_data_s);
    data->items = items;
    return data;
}

void checkAccount(const std::vector<std::string>& items) {
    const Data data = dataOf(items);
    vantor_pim_sync_account_s* raw = nullptr;
    if (vantor_pim_sync_ipc_unmarshal_sync_account(data.get(), &raw) != 0) {
        require(raw == nullptr, "a refusal changes nothing");
        return;
    }
    const AccountRecord account(raw);
    const Data sent(pims_ipc_data_create_with_size(0, 0));
    if (vantor_pim_sync_ipc_marshal_sync_account(account.get(), sent.get()) != 0) return;  // over the limit
    require(vantor_pim_sync_ipc_unmarshal_sync_account(sent.get(), &raw) == 0, "an account can be read");
    const AccountRecord again(raw);
    const Data resent(pims_ipc_data_create_with_size(0, 0));
    require(vantor_pim_sync_ipc_marshal_sync_account(again.get(), resent.get()) == 0 &&
                resent->items == sent->items,
            "an account is read to the same");
}

void checkArguments(const std::vector<std::string>& items) {
    checkAccount(items);
    const Data data = dataOf(items);
    int number = 0;
    bool flag = false;
    char* text = nullptr;
    (void)vantor_pim_sync_ipc_unmarshal_int(data.get(), &number);
    (void)vantor_pim_sync_ipc_unmarshal_bool(data.get(), &flag);
    if (vantor_pim_sync_ipc_unmarshal_string(data.get(), &text) == 0) std::free(text);
}

void checkPayload(const std::string& payload) {
    uint32_t sequence = 0;
    std::vector<std::string> items;
    if (!platform::ipc::parseFrame(payload, &sequence, &items)) return;
    const std::vector<std::string_view> views(items.begin(), items.end());
    require(
        platform::ipc::composeFrame(sequence, views, nullptr).substr(platform::ipc::kLengthBytes) == payload,
        "a frame is composed as it came");
    checkArguments(items);
    if (items.size() > 2) checkArguments({items.begin() + 2, items.end()});
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size == 0) return 0;
    const std::string bytes = fuzz::textOf(data, size);
    const size_t step = 1 + static_cast<unsigned char>(bytes[0]);
    const std::string_view stream = std::string_view(bytes).substr(1);
    Cut inPieces = Cut::kIncomplete;
    Cut atOnce = Cut::kIncomplete;
    const std::vector<std::string> payloads = payloadsOf(stream, step, &inPieces);
    require(payloads == payloadsOf(stream, std::max<size_t>(stream.size(), 1), &atOnce) && inPieces == atOnce,
            "it does not matter in which pieces a stream arrives");
    for (const std::string& payload : payloads) checkPayload(payload);
    return 0;
}
