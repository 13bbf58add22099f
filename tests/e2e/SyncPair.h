// SyncPair: a provider and a device that knows some of its accounts; the laws that hold after every sync.
#pragma once

#include <map>
#include <set>
#include <string>
#include <vector>

#include "e2e/Device.h"
#include "e2e/ExpectedEvents.h"
#include "e2e/Provider.h"

class SyncPair {
public:
    // Adds accounts 1..accounts of the provider, in its order; only this kind of them is kept in step.
    explicit SyncPair(int accounts = 1,
                      const std::vector<std::string>& providerArguments = {"--seed", "sample"},
                      const std::string& kind = "calendar");

    CommandResult sync(int account) { return device.sync(account, mKind); }

    // Fails the test unless the account's calendars, events, task lists and tasks are the same on both sides, once each.
    void expectSame(int account);
    // Likewise its groups, contacts, memberships and photos. Groups are told apart by name.
    void expectSameContacts(int account);
    // Takes away the contact of the sample that gets fields from a profile, which the feed does not show.
    void removeProfileLinks();
    // Fails the test unless another sync sends no write and changes no store.
    void expectQuiet(int account);

    [[nodiscard]] std::vector<Json> wireCalendars(int account);
    [[nodiscard]] std::vector<Json> wireEvents(const std::string& calendarId);
    [[nodiscard]] std::vector<Json> wireTaskLists(int account);
    [[nodiscard]] std::vector<Json> wireTasks(int account, const std::string& listId);
    // "/accounts/EMAIL/tasklists/ID/tasks", for the admin services.
    [[nodiscard]] std::string tasksPath(int account, const std::string& listId);
    [[nodiscard]] std::vector<Json> wireContacts(int account);
    [[nodiscard]] std::vector<Json> wireGroups(int account);
    // "/accounts/EMAIL/contacts" or ".../groups", for the admin services.
    [[nodiscard]] std::string peoplePath(int account, const char* kind);
    // The device's calendar, or task list, with this name.
    [[nodiscard]] int localCalendar(int account, const std::string& name);
    [[nodiscard]] std::string firstCalendar(int account) { return wireCalendars(account).at(0)["id"]; }
    // The local event with this server id.
    [[nodiscard]] Json localEvent(const std::string& uid);
    [[nodiscard]] Json localTodo(const std::string& uid);
    // The provider's requests so far, counted by method.
    [[nodiscard]] std::map<std::string, int> requestCounts();
    void installFault(const Json& fault) { provider.admin("POST", "/faults", fault); }
    void expectFaultsUsed();
    // Whether the provider has noted such a request, by method and the path's begin; it does when it has answered.
    bool isNoted(const std::string& request);

    Provider provider;
    Device device;

private:
    void expectSameEvents(const Json& book, const Json& calendar);
    void expectSameTasks(int account, const Json& books);

    const std::string mKind;
};

// A calendar's id inside an admin path.
std::string pathText(const std::string& id);
