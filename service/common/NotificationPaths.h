// The notification files: truncated by the daemon at every state change, watched by clients. Installation (or the tool's
// "init") makes them; neither side does.
#pragma once

inline constexpr const char* kCalendarNotificationPath =
    "/opt/usr/data/vantor-pim-sync/.notificationPathCalendar";
inline constexpr const char* kContactsNotificationPath =
    "/opt/usr/data/vantor-pim-sync/.notificationPathContacts";
