// EventFields.h: the fields of an event record that are more than one property: its rule, its exception dates.
#pragma once

#include <string>
#include <vector>

#include "RruleText.h"
#include "platform/calendar.h"

namespace event_fields {

RruleFields ruleOf(calendar_record_h event);
void setRule(calendar_record_h event, const RruleFields& rule);

// The record keeps the recurrence ids of cancelled instances as one text, joined with ", ".
std::vector<std::string> splitDates(const std::string& dates);
// Appended unless it is there.
std::string withDate(const std::string& dates, const std::string& date);

// Whether the time zone database knows the name.
bool isTimeZone(const std::string& name);

}  // namespace event_fields
