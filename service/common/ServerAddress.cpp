#include "common/ServerAddress.h"

#include "common/Account.h"
#include "platform/error.h"
#include "platform/settings.h"

namespace server_address {

namespace {

// Whether the host part of a bare address carries a port already ("host:8080", "[::1]:8080").
bool hasPort(const std::string& host) {
    const size_t colon = host.rfind(':');
    if (colon == std::string::npos) return false;
    const size_t bracket = host.rfind(']');
    // Several colons without brackets are an IPv6 address, not a port.
    if (bracket == std::string::npos) return host.find(':') == colon;
    return colon > bracket;
}

std::string withBrackets(const std::string& host) {
    const bool bareIpv6 = host.find(':') != host.rfind(':') && host.find('[') == std::string::npos;
    return bareIpv6 ? "[" + host + "]" : host;
}

std::string setting(const char* key, const std::string& fallback) {
    std::string value;
    if (vconf_get_str(key, &value) != PLATFORM_ERROR_NONE || value.empty()) return fallback;
    return compose(value, 0, /*ssl=*/true);
}

std::string defaultBase(const Account& account) {
    return account.getCalendarSync() || account.getContactsServer().empty() ? calendarBase(account)
                                                                            : contactsBase(account);
}

}  // namespace

std::string compose(const std::string& server, int port, bool ssl) {
    if (server.empty()) return {};
    const size_t scheme = server.find("://");
    std::string prefix =
        scheme == std::string::npos ? (ssl ? "https://" : "http://") : server.substr(0, scheme + 3);
    const std::string rest = scheme == std::string::npos ? server : server.substr(scheme + 3);
    const size_t slash = rest.find('/');
    std::string host = withBrackets(rest.substr(0, slash));
    std::string path = slash == std::string::npos ? "" : rest.substr(slash);
    while (!path.empty() && path.back() == '/') path.pop_back();
    if (port > 0 && !hasPort(host)) host += ":" + std::to_string(port);
    return prefix + host + path;
}

std::string calendarBase(const Account& account) {
    return compose(account.getCalendarServer(), account.getCalendarServerPort(), account.getSsl());
}

std::string contactsBase(const Account& account) {
    return compose(account.getContactsServer(), account.getContactsServerPort(), account.getSsl());
}

std::string tokenBase(const Account& account) {
    return setting("db/vantor-pim-sync/token_server", defaultBase(account));
}

std::string peopleBase(const Account& account) {
    return setting("db/vantor-pim-sync/people_server", defaultBase(account));
}

}  // namespace server_address
