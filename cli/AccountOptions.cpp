#include "AccountOptions.h"

#include <algorithm>

#include "Command.h"
#include "Failure.h"
#include "ServerUrl.h"

namespace {

constexpr int kMostPeriodMinutes = 365 * 24 * 60;
constexpr int kHttpPort = 80;
constexpr int kHttpsPort = 443;

void addToggle(CLI::App& app, const std::string& name, std::optional<bool>& value, const std::string& help) {
    const auto set = [&value, name](int64_t count) { value = count > 0; };
    app.add_flag_function("--" + name + ",!--no-" + name, set, help);
}

void checkServer(const std::string& text, const std::string& option) {
    if (text.empty() || ServerUrl::parse(text)) return;
    throw Misuse(option + " takes a URL as https://pim.example or a host, not \"" + text + "\"");
}

void checkEmail(const std::string& email) {
    const bool isPlain = std::none_of(email.begin(), email.end(), [](char c) { return c >= 0 && c <= ' '; });
    const size_t at = email.find('@');
    if (email.empty() || (isPlain && at != std::string::npos && at > 0 && at + 1 < email.size())) return;
    throw Misuse("--email takes an address as me@example.com, not \"" + email + "\"");
}

// The daemon appends the stored port to an address without one. So an address that replaces one with a port of its
// own says which port it means.
void setServer(const std::string& text, bool ssl, char*& server, int32_t& port) {
    if (text.empty()) return;
    const ServerUrl url = ServerUrl::parse(text).value_or(ServerUrl());
    const bool isHttps =
        url.scheme == ServerUrl::Scheme::kNone ? ssl : url.scheme == ServerUrl::Scheme::kHttps;
    if (port > 0 && url.port == 0) port = isHttps ? kHttpsPort : kHttpPort;
    if (url.port > 0 && port > 0) port = url.port;
    sync_client::setText(server, text);
}

}  // namespace

void AccountOptions::declare(CLI::App& app) {
    app.add_option("--email", email, "E-mail address of the account");
    app.add_option("--server", server, "Address of the account's services: a URL or a host (https)");
    app.add_option("--calendar-server", calendarServer,
                   "Address of the calendar service, when it is another");
    app.add_option("--contacts-server", contactsServer,
                   "Address of the contacts service, when it is another");
    addToggle(app, "calendar", calendar, "Keep calendars in step, or not");
    addToggle(app, "contacts", contacts, "Keep contacts in step, or not");
    addToggle(app, "roaming", roaming, "Scheduled syncs while roaming, or not");
    command::addNumber(app, "--calendar-period", calendarPeriod, 0, kMostPeriodMinutes,
                       "Minutes between calendar syncs; 0: on request only");
    command::addNumber(app, "--contacts-period", contactsPeriod, 0, kMostPeriodMinutes,
                       "Minutes between contacts syncs; 0: on request only");
    app.add_option("--refresh-token-file", tokenFile,
                   "File with the refresh token; '-' reads standard input");
}

void AccountOptions::checkTexts() const {
    checkEmail(email);
    checkServer(server, "--server");
    checkServer(calendarServer, "--calendar-server");
    checkServer(contactsServer, "--contacts-server");
}

bool AccountOptions::saysNothing() const {
    return email.empty() && server.empty() && calendarServer.empty() && contactsServer.empty() && !calendar &&
           !contacts && !roaming && calendarPeriod < 0 && contactsPeriod < 0 && tokenFile.empty();
}

void AccountOptions::apply(vantor_pim_sync_account_s& record) const {
    // The flag decides for bare hosts; a host without a scheme gets the safe one.
    const auto first = ServerUrl::parse(calendarText());
    if (first) record.ssl = first->scheme != ServerUrl::Scheme::kHttp;
    setServer(calendarText(), record.ssl, record.calserver, record.calserverport);
    setServer(contactsText(), record.ssl, record.ctserver, record.ctserverport);
    if (!email.empty()) sync_client::setText(record.email, email);
    if (calendar) record.calsync = *calendar;
    if (contacts) record.ctsync = *contacts;
    if (roaming) record.roaming = *roaming ? 1 : 0;
    if (calendarPeriod >= 0) record.calperiod = calendarPeriod;
    if (contactsPeriod >= 0) record.ctperiod = contactsPeriod;
}
