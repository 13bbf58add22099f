// Records and values across the wire.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "common/vantor_pim_sync_ipc_marshal.h"

namespace {

struct Destroy {
    void operator()(pims_ipc_data_h data) const noexcept { pims_ipc_data_destroy(data); }
    void operator()(vantor_pim_sync_account_s* account) const noexcept {
        vantor_pim_sync_free_account(account);
    }
};
using Data = std::unique_ptr<pims_ipc_data_s, Destroy>;
using OwnedAccount = std::unique_ptr<vantor_pim_sync_account_s, Destroy>;

Data newData() {
    return Data(pims_ipc_data_create_with_size(1024, 0));
}

OwnedAccount account(const char* text) {
    OwnedAccount record(
        static_cast<vantor_pim_sync_account_s*>(calloc(1, sizeof(vantor_pim_sync_account_s))));
    *record = {.account_id = 7,
               .access_token = nullptr,
               .refresh_token = nullptr,
               .email = nullptr,
               .reserved = -3,
               .ssl = true,
               .calsync = false,
               .calserver = nullptr,
               .calserverport = 443,
               .ctsync = true,
               .ctserver = nullptr,
               .ctserverport = 0,
               .calperiod = 15,
               .ctperiod = -1,
               .roaming = 1};
    if (text != nullptr) {
        for (char** field : {&record->access_token, &record->refresh_token, &record->email,
                             &record->calserver, &record->ctserver}) {
            *field = strdup(text);
        }
    }
    return record;
}

std::vector<std::string> itemsOf(pims_ipc_data_h data) {
    std::vector<std::string> items;
    size_t size = 0;
    while (const void* item = pims_ipc_data_get(data, &size))
        items.emplace_back(static_cast<const char*>(item), size);
    return items;
}

Data dataOf(const std::vector<std::string>& items) {
    Data data = newData();
    for (const std::string& item : items)
        EXPECT_EQ(pims_ipc_data_put(data.get(), item.data(), item.size()), 0);
    return data;
}

}  // namespace

TEST(Marshal, RecordsComeBackAsTheyWent) {
    const std::string large(10'000, 'q');
    for (const char* text : {static_cast<const char*>(nullptr), "", "it's \"quoted\"\n", large.c_str()}) {
        const OwnedAccount sent = account(text);
        const Data data = newData();
        ASSERT_EQ(vantor_pim_sync_ipc_marshal_sync_account(sent.get(), data.get()), 0);
        vantor_pim_sync_account_s* raw = nullptr;
        ASSERT_EQ(vantor_pim_sync_ipc_unmarshal_sync_account(data.get(), &raw), 0);
        const OwnedAccount got(raw);
        EXPECT_EQ(got->account_id, 7);
        EXPECT_EQ(got->reserved, -3);
        EXPECT_TRUE(got->ssl && !got->calsync && got->ctsync);
        EXPECT_EQ(got->calserverport, 443);
        EXPECT_EQ(got->ctperiod, -1);
        EXPECT_STREQ(got->access_token, text);
        EXPECT_STREQ(got->email, text);
        EXPECT_STREQ(got->ctserver, text);
    }
}

TEST(Marshal, TheWireOrderPutsTheAddressTwelfth) {
    OwnedAccount record = account(nullptr);
    record->email = strdup("me");
    const Data data = newData();
    ASSERT_EQ(vantor_pim_sync_ipc_marshal_sync_account(record.get(), data.get()), 0);
    const std::vector<std::string> items = itemsOf(data.get());
    ASSERT_EQ(items.size(), 16U);
    EXPECT_EQ(items[12], std::string("me\0", 3));
    EXPECT_EQ(items[4].size(), 1U);
}

TEST(Marshal, ATruncatedRecordIsAFailedReadWhereverItEnds) {
    const Data whole = newData();
    ASSERT_EQ(vantor_pim_sync_ipc_marshal_sync_account(account("text").get(), whole.get()), 0);
    const std::vector<std::string> items = itemsOf(whole.get());
    for (size_t count = 0; count < items.size(); ++count) {
        const Data data = dataOf({items.begin(), items.begin() + static_cast<ptrdiff_t>(count)});
        vantor_pim_sync_account_s* raw = nullptr;
        const int result = vantor_pim_sync_ipc_unmarshal_sync_account(data.get(), &raw);
        const OwnedAccount got(raw);
        EXPECT_EQ(result, -1) << count;
        EXPECT_EQ(raw, nullptr) << count;
    }
}

TEST(Marshal, ItemsOfTheWrongSizeAreNotRead) {
    const std::string four(4, '\x02');
    int number = 17;
    bool flag = false;
    char* text = nullptr;
    for (const std::string& item : {std::string(), std::string(3, 'x'), std::string(5, 'x')}) {
        EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_int(dataOf({item}).get(), &number), -1);
        EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_bool(dataOf({item}).get(), &flag), -1);
        EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_string(dataOf({item, "a"}).get(), &text), -1);
    }
    EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_string(dataOf({four, "no end"}).get(), &text), -1);
    EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_string(dataOf({four, ""}).get(), &text), -1);
    EXPECT_EQ(number, 17);
    EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_string(dataOf({four}).get(), &text), 0)
        << "a missing text is NULL";
    EXPECT_EQ(text, nullptr);
    EXPECT_EQ(vantor_pim_sync_ipc_marshal_int(1, nullptr), -1);
    EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_int(nullptr, &number), -1);
    vantor_pim_sync_free_account(nullptr);
}
