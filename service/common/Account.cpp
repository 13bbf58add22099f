#include "common/Account.h"

#include "common/SyncLog.h"

Account::Account(const vantor_pim_sync_account_s& record) {
    update(&record);
}

Account::~Account() = default;

void Account::update(const vantor_pim_sync_account_s* record) {
    SYNC_ASSERT_TEXT(record != nullptr, "pAccountInfo");
    const auto copyText = [](std::string* field, const char* text) {
        if (text != nullptr) *field = text;
    };
    const auto copyPort = [](int* field, int port) {
        if (port > 0) *field = port;
    };
    const std::lock_guard lock(mMutex);
    mFields.accountId = record->account_id;
    copyText(&mFields.accessToken, record->access_token);
    copyText(&mFields.refreshToken, record->refresh_token);
    copyText(&mFields.email, record->email);
    mFields.reserved = record->reserved;
    mFields.ssl = record->ssl;
    mFields.calendarSync = record->calsync;
    copyText(&mFields.calendarServer, record->calserver);
    copyPort(&mFields.calendarServerPort, record->calserverport);
    mFields.contactsSync = record->ctsync;
    copyText(&mFields.contactsServer, record->ctserver);
    copyPort(&mFields.contactsServerPort, record->ctserverport);
    mFields.calendarPeriod = record->calperiod;
    mFields.contactsPeriod = record->ctperiod;
    mFields.roaming = record->roaming;
}

template <class T>
T Account::get(T Fields::*field) const {
    const std::lock_guard lock(mMutex);
    return mFields.*field;
}

int Account::getAccountId() const {
    return get(&Fields::accountId);
}
std::string Account::getAccessToken() const {
    return get(&Fields::accessToken);
}
std::string Account::getRefreshToken() const {
    return get(&Fields::refreshToken);
}
int Account::getReserved() const {
    return get(&Fields::reserved);
}
bool Account::getSsl() const {
    return get(&Fields::ssl);
}
bool Account::getCalendarSync() const {
    return get(&Fields::calendarSync);
}
std::string Account::getCalendarServer() const {
    return get(&Fields::calendarServer);
}
int Account::getCalendarServerPort() const {
    return get(&Fields::calendarServerPort);
}
bool Account::getContactsSync() const {
    return get(&Fields::contactsSync);
}
std::string Account::getContactsServer() const {
    return get(&Fields::contactsServer);
}
int Account::getContactsServerPort() const {
    return get(&Fields::contactsServerPort);
}
std::string Account::getEmail() const {
    return get(&Fields::email);
}
int Account::getCalendarPeriod() const {
    return get(&Fields::calendarPeriod);
}
int Account::getContactsPeriod() const {
    return get(&Fields::contactsPeriod);
}
int Account::getRoaming() const {
    return get(&Fields::roaming);
}

void Account::setAccessToken(const std::string& token) {
    const std::lock_guard lock(mMutex);
    mFields.accessToken = token;
}
