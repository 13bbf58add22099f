#include "common/vantor_pim_sync_ipc_marshal.h"

#include <cstdlib>
#include <cstring>
#include <memory>

#include "common/SyncLog.h"
#include "common/SyncResult.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

constexpr int kNullLength = -1;

// A record's field, in wire order, which is not the order of declaration.
struct Field {
    enum Kind { kInt, kBool, kText } kind;
    int32_t vantor_pim_sync_account_s::*number;
    bool vantor_pim_sync_account_s::*flag;
    char* vantor_pim_sync_account_s::*text;
};
using Record = vantor_pim_sync_account_s;
constexpr Field intField(int32_t Record::*member) {
    return {Field::kInt, member, nullptr, nullptr};
}
constexpr Field boolField(bool Record::*member) {
    return {Field::kBool, nullptr, member, nullptr};
}
constexpr Field textField(char* Record::*member) {
    return {Field::kText, nullptr, nullptr, member};
}

constexpr Field kFields[] = {
    intField(&Record::account_id), textField(&Record::access_token), textField(&Record::refresh_token),
    intField(&Record::reserved),   boolField(&Record::ssl),          boolField(&Record::calsync),
    textField(&Record::calserver), intField(&Record::calserverport), boolField(&Record::ctsync),
    textField(&Record::ctserver),  intField(&Record::ctserverport),  textField(&Record::email),
    intField(&Record::calperiod),  intField(&Record::ctperiod),      intField(&Record::roaming),
};

int put(pims_ipc_data_h data, const void* value, size_t size) {
    return pims_ipc_data_put(data, value, size) == 0 ? kOk : kFailed;
}

struct FreeAccount {
    void operator()(Record* record) const noexcept { vantor_pim_sync_free_account(record); }
};

}  // namespace

int vantor_pim_sync_ipc_marshal_int(int value, pims_ipc_data_h data) {
    if (data == nullptr) {
        SYNC_ERR("data is null");
        return kFailed;
    }
    const int32_t item = value;
    return put(data, &item, sizeof item);
}

int vantor_pim_sync_ipc_marshal_bool(bool value, pims_ipc_data_h data) {
    if (data == nullptr) {
        SYNC_ERR("data is null");
        return kFailed;
    }
    const char item = value ? 1 : 0;
    return put(data, &item, sizeof item);
}

int vantor_pim_sync_ipc_marshal_string(const char* value, pims_ipc_data_h data) {
    if (data == nullptr) {
        SYNC_ERR("data is null");
        return kFailed;
    }
    if (value == nullptr) return vantor_pim_sync_ipc_marshal_int(kNullLength, data);
    const size_t length = strlen(value);
    const int lengthResult = vantor_pim_sync_ipc_marshal_int(static_cast<int>(length), data);
    const int textResult = put(data, value, length + 1);
    return lengthResult == kOk && textResult == kOk ? kOk : kFailed;
}

int vantor_pim_sync_ipc_marshal_sync_account(const vantor_pim_sync_account_s* account, pims_ipc_data_h data) {
    if (account == nullptr || data == nullptr) {
        SYNC_ERR("data is null");
        return kFailed;
    }
    for (const Field& field : kFields) {
        int result = kFailed;
        switch (field.kind) {
            case Field::kInt:
                result = vantor_pim_sync_ipc_marshal_int(account->*field.number, data);
                break;
            case Field::kBool:
                result = vantor_pim_sync_ipc_marshal_bool(account->*field.flag, data);
                break;
            case Field::kText:
                result = vantor_pim_sync_ipc_marshal_string(account->*field.text, data);
                break;
        }
        if (result != kOk) return kFailed;
    }
    return kOk;
}

int vantor_pim_sync_ipc_unmarshal_int(pims_ipc_data_h data, int* value) {
    if (data == nullptr || value == nullptr) {
        SYNC_ERR("data is null");
        return kFailed;
    }
    size_t size = 0;
    const void* item = pims_ipc_data_get(data, &size);
    if (item == nullptr || size != sizeof(int32_t)) {
        SYNC_ERR("pims_ipc_data_get int fail");
        return kFailed;
    }
    int32_t number = 0;
    memcpy(&number, item, sizeof number);
    *value = number;
    return kOk;
}

int vantor_pim_sync_ipc_unmarshal_bool(pims_ipc_data_h data, bool* value) {
    if (data == nullptr || value == nullptr) {
        SYNC_ERR("data is null");
        return kFailed;
    }
    size_t size = 0;
    const void* item = pims_ipc_data_get(data, &size);
    if (item == nullptr || size != 1) {
        SYNC_ERR("pims_ipc_data_get int fail");
        return kFailed;
    }
    *value = *static_cast<const char*>(item) != 0;
    return kOk;
}

int vantor_pim_sync_ipc_unmarshal_string(pims_ipc_data_h data, char** value) {
    if (data == nullptr || value == nullptr) {
        SYNC_ERR("data is null");
        return kFailed;
    }
    size_t size = 0;
    const void* item = pims_ipc_data_get(data, &size);
    int32_t length = 0;
    if (item == nullptr || size != sizeof length) {
        SYNC_ERR("pims_ipc_data_get string fail");
        return kFailed;
    }
    memcpy(&length, item, sizeof length);
    const auto* text =
        length == kNullLength ? nullptr : static_cast<const char*>(pims_ipc_data_get(data, &size));
    if (text == nullptr) {
        *value = nullptr;
        return kOk;
    }
    if (memchr(text, '\0', size) == nullptr) {
        SYNC_ERR("pims_ipc_data_get string fail");
        return kFailed;
    }
    *value = strdup(text);
    return kOk;
}

int vantor_pim_sync_ipc_unmarshal_sync_account(pims_ipc_data_h data, vantor_pim_sync_account_s** account) {
    if (data == nullptr || account == nullptr) {
        SYNC_ERR("data is null");
        return kFailed;
    }
    std::unique_ptr<Record, FreeAccount> block(static_cast<Record*>(calloc(1, sizeof(Record))));
    if (!block) {
        SYNC_ERR("calloc fail");
        return kFailed;
    }
    Record* record = block.get();
    for (const Field& field : kFields) {
        int result = kFailed;
        switch (field.kind) {
            case Field::kInt:
                result = vantor_pim_sync_ipc_unmarshal_int(data, &(record->*field.number));
                break;
            case Field::kBool:
                result = vantor_pim_sync_ipc_unmarshal_bool(data, &(record->*field.flag));
                break;
            case Field::kText:
                result = vantor_pim_sync_ipc_unmarshal_string(data, &(record->*field.text));
                break;
        }
        if (result != kOk) return result;
    }
    *account = block.release();
    return kOk;
}

void vantor_pim_sync_free_account(vantor_pim_sync_account_s* account) {
    if (account == nullptr) return;
    free(account->access_token);
    free(account->refresh_token);
    free(account->email);
    free(account->calserver);
    free(account->ctserver);
    free(account);
}
