// Who is told of a state change: clients, the settings store, the account service; and the schedule.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/stat.h>

#include <filesystem>

#include "common/NotificationPaths.h"
#include "common/NotificationReceiveManager.h"
#include "common/NotificationSendManager.h"
#include "common/SyncScheduleManager.h"
#include "platform/account.h"
#include "platform/settings.h"
#include "service/common/MainLoop.h"
#include "support/TestRoot.h"

namespace {

constexpr auto kCalendar = VANTOR_PIM_SYNC_TYPE_CALENDAR;
constexpr auto kContacts = VANTOR_PIM_SYNC_TYPE_CONTACTS;

void count(vantor_pim_sync_type_e, void* counter) {
    ++*static_cast<int*>(counter);
}

size_t inotifyDescriptors() {
    size_t found = 0;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
        std::error_code ignored;
        found += std::filesystem::read_symlink(entry, ignored).string().find("inotify") != std::string::npos
                     ? 1
                     : 0;
    }
    return found;
}

int runningKey() {
    int value = -1;
    (void)vconf_get_int("memory/sync/vantor-pim-sync", &value);
    return value;
}

int accountStatus(int id) {
    account_h account = nullptr;
    EXPECT_EQ(account_create(&account), 0);
    account_sync_state_e status = ACCOUNT_SYNC_INVALID;
    if (account_query_account_by_account_id(id, &account) == 0) {
        EXPECT_EQ(account_get_sync_support(account, &status), 0);
    }
    account_destroy(account);
    return status;
}

}  // namespace

TEST(Notification, ListenersOfAKindAreToldAndShareOneDescriptor) {
    const TestRoot root;
    const size_t before = inotifyDescriptors();
    NotificationReceiveManager receivers;
    NotificationSendManager sender;
    int first = 0;
    int second = 0;
    int other = 0;
    EXPECT_EQ(receivers.attachListener(nullptr), -1);
    receivers.attachListener(std::make_shared<StateChangedListener>(kCalendar, count, &first));
    receivers.attachListener(std::make_shared<StateChangedListener>(kCalendar, count, &second));
    receivers.attachListener(std::make_shared<StateChangedListener>(kContacts, count, &other));
    EXPECT_EQ(inotifyDescriptors(), before + 1);

    sender.notifyChange(7, kCalendar, NotificationSendManager::SYNC_STATE_NO_CHANGE);
    ASSERT_TRUE(iterateUntil([&] { return first == 1 && second == 1; }));
    EXPECT_EQ(other, 0);

    EXPECT_NE(receivers.detachListener(kCalendar, count, &first), nullptr);
    EXPECT_EQ(receivers.detachListener(kCalendar, count, &first), nullptr);
    sender.notifyChange(7, kCalendar, NotificationSendManager::SYNC_STATE_NO_CHANGE);
    ASSERT_TRUE(iterateUntil([&] { return second == 2; }));
    EXPECT_EQ(first, 1);
    EXPECT_NE(receivers.detachListener(kCalendar, count, &second), nullptr);
    EXPECT_NE(receivers.detachListener(kContacts, count, &other), nullptr);
    EXPECT_EQ(inotifyDescriptors(), before);
}

TEST(Notification, RunningSyncsAreCountedPerAccountAndInAll) {
    const TestRoot root;
    ASSERT_EQ(account_insert(7, "package", ""), 0);
    ASSERT_EQ(account_insert(8, "package", ""), 0);
    NotificationSendManager sender;
    const auto change = [&sender](int id, vantor_pim_sync_type_e type, int state) {
        sender.notifyChange(id, type, static_cast<NotificationSendManager::sync_state>(state));
    };
    change(7, kCalendar, 2);  // an end without a beginning changes no account
    EXPECT_EQ(accountStatus(7), ACCOUNT_SYNC_STATUS_OFF);
    NotificationSendManager counted;
    struct Step {
        int id;
        vantor_pim_sync_type_e type;
        int state;
        int key, first, second;
    };
    for (const Step& step :
         {Step{7, kCalendar, 1, 1, 4, 2}, Step{8, kCalendar, 1, 1, 4, 4}, Step{7, kContacts, 1, 1, 4, 4},
          Step{7, kCalendar, 2, 1, 4, 4}, Step{8, kCalendar, 2, 1, 4, 3}, Step{7, kCalendar, 0, 1, 4, 3},
          Step{7, kContacts, 2, 0, 3, 3}}) {
        counted.notifyChange(step.id, step.type,
                             static_cast<NotificationSendManager::sync_state>(step.state));
        EXPECT_EQ(runningKey(), step.key);
        EXPECT_EQ(accountStatus(7), step.first);
        EXPECT_EQ(accountStatus(8), step.second);
    }
}

TEST(Notification, AMissingFileEndsTheProcess) {
    const TestRoot root;
    std::filesystem::remove(root.at(kContactsNotificationPath));
    EXPECT_DEATH(
        NotificationSendManager().notifyChange(7, kContacts, NotificationSendManager::SYNC_STATE_NO_CHANGE),
        "fd != -1");
}

TEST(Notification, WhatIsPutInAFilesPlaceIsNotFollowed) {
    const TestRoot root;
    const std::filesystem::path victim = root.path() / "victim";
    std::ofstream(victim) << "precious";
    for (const char* path : {kCalendarNotificationPath, kContactsNotificationPath})
        std::filesystem::remove(root.at(path));
    std::filesystem::create_symlink(victim, root.at(kCalendarNotificationPath));
    ASSERT_EQ(mkfifo(root.at(kContactsNotificationPath).c_str(), 0600), 0);

    NotificationReceiveManager receivers;
    int told = 0;
    receivers.attachListener(std::make_shared<StateChangedListener>(kCalendar, count, &told));
    std::ofstream(victim, std::ios::app) << "!";
    iterateReady();
    EXPECT_EQ(told, 0) << "writes to another file are nobody's business";
    receivers.detachAllListeners();

    EXPECT_DEATH(
        NotificationSendManager().notifyChange(7, kCalendar, NotificationSendManager::SYNC_STATE_NO_CHANGE),
        "fd != -1");
    EXPECT_EQ(std::filesystem::file_size(victim), 9U);
    // Neither waits for a reader that never comes.
    NotificationSendManager().notifyChange(7, kContacts, NotificationSendManager::SYNC_STATE_NO_CHANGE);
}

TEST(SyncScheduleManager, AlarmsCallTheirListener) {
    struct Listener : ISyncScheduleListener {
        void onSchedule() override { ++calls; }
        int calls = 0;
    };
    const TestRoot root;
    SyncScheduleManager manager;
    Listener listener;
    EXPECT_EQ(manager.addSchedule(nullptr, 15), -1);
    EXPECT_EQ(manager.addSchedule(&listener, 0), 0);
    EXPECT_EQ(manager.removeSchedule(&listener), -1) << "a period of 0 makes no alarm";
    const time_t now = time(nullptr);
    ASSERT_EQ(manager.addSchedule(&listener, 15), 0);
    EXPECT_NEAR(static_cast<double>(manager.nextAlarm(&listener) - now), 900, 2);

    std::vector<alarm_id_t> ids;
    const auto collect = [](alarm_id_t id, void* list) {
        static_cast<std::vector<alarm_id_t>*>(list)->push_back(id);
        return 0;
    };
    ASSERT_EQ(alarmmgr_enum_alarm_ids(collect, &ids), 0);
    ASSERT_EQ(ids.size(), 1U);
    ASSERT_EQ(vconf_set_int("db/setting/psmode", 2), 0);
    SyncScheduleManager::alarmCallback(ids[0], &manager);
    EXPECT_EQ(listener.calls, 0) << "power saving";
    ASSERT_EQ(vconf_set_int("db/setting/psmode", 0), 0);
    SyncScheduleManager::alarmCallback(ids[0] + 1, &manager);
    EXPECT_EQ(listener.calls, 0) << "not its alarm";
    SyncScheduleManager::alarmCallback(ids[0], &manager);
    EXPECT_EQ(listener.calls, 1);

    SyncScheduleManager next;  // the alarms of an earlier run are cleared
    ids.clear();
    ASSERT_EQ(alarmmgr_enum_alarm_ids(collect, &ids), 0);
    EXPECT_TRUE(ids.empty());
}
