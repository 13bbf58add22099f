#include "exchange/ICalendarValues.h"

#include <libical/ical.h>

#include <memory>

#include "Failure.h"
#include "Handles.h"
#include "RruleText.h"
#include "TimeText.h"

namespace exchange::ical_values {

namespace {

constexpr size_t kMostValueBytes = 1024;
constexpr size_t kMostShownBytes = 80;
constexpr std::string_view kMailto = "MAILTO:";
constexpr std::string_view kUntil = "UNTIL=";
constexpr int kMinutesPerDay = 1440;
constexpr int kMinutesPerHour = 60;
// Ten thousand years. A zone is asked for the end, and goes through every change until then.
constexpr int64_t kMostDays = 3'652'425;
// Stand as they are in an address; the others are percent-encoded, so that no address ends its line.
constexpr const char* kAddressCharacters = "!$&'*+,;=:@/?";

struct IcalTextDeleter {
    void operator()(char* text) const noexcept { icalmemory_free_buffer(text); }
};

// As another program may spell it; "" when it is no rule, or one of another calendar than ours.
std::string normalised(const std::string& value) {
    if (value.size() > kMostValueBytes || value.find("RSCALE") != std::string::npos) return {};
    icalerror_set_errors_are_fatal(0);
    icalrecurrencetype rule = icalrecurrencetype_from_string(value.c_str());
    if (rule.freq == ICAL_NO_RECURRENCE) return {};
    const std::unique_ptr<char, IcalTextDeleter> spelt(icalrecurrencetype_as_string_r(&rule));
    return spelt != nullptr ? spelt.get() : "";
}

// An end without a zone is one of the series' zone.
std::string withInstant(std::string rule, const std::function<int64_t(int64_t)>& toUtc) {
    const size_t at = rule.find(kUntil);
    if (at == std::string::npos) return rule;
    const size_t start = at + kUntil.size();
    const std::string until = rule.substr(start, rule.find(';', start) - start);
    if (until.find('T') == std::string::npos || until.ends_with('Z')) return rule;
    auto time = time_text::parseCompact(until + "Z");
    if (!time) return rule;
    time->utime = toUtc(time->utime);
    return rule.replace(start, until.size(), time_text::composeCompact(*time));
}

}  // namespace

std::optional<Duration> durationOf(const std::string& text) {
    if (text.size() > kMostValueBytes) return std::nullopt;
    icalerror_set_errors_are_fatal(0);
    const icaldurationtype duration = icaldurationtype_from_string(text.c_str());
    if (icaldurationtype_is_bad_duration(duration) != 0) return std::nullopt;
    const int64_t sign = duration.is_neg != 0 ? -1 : 1;
    const int64_t days = int64_t{duration.weeks} * 7 + duration.days;
    const int64_t minutes = int64_t{duration.hours} * 60 + duration.minutes;
    if (days > kMostDays || minutes > kMostDays * kMinutesPerDay) return std::nullopt;
    return Duration{sign * days, sign * (minutes * 60 + duration.seconds)};
}

std::string beforeStart(int64_t minutes) {
    const int64_t days = minutes / kMinutesPerDay;
    const int64_t hours = minutes % kMinutesPerDay / kMinutesPerHour;
    const int64_t rest = minutes % kMinutesPerHour;
    std::string text = "-P";
    if (days != 0) text += std::to_string(days) + "D";
    if (hours != 0 || rest != 0 || days == 0) text += "T";
    if (hours != 0) text += std::to_string(hours) + "H";
    if (rest != 0 || (hours == 0 && days == 0)) text += std::to_string(rest) + "M";
    return text;
}

std::string ruleOf(const std::string& value, const std::function<int64_t(int64_t wallSec)>& toUtc) {
    RruleFields fields;
    std::string reason;
    if (rrule_text::parse(withInstant(content_line::upper(value), toUtc), &fields, &reason))
        return rrule_text::compose(fields);
    const std::string rule = normalised(content_line::upper(value));
    if (rule.empty()) throw Failure("its rule (RRULE) cannot be read: " + value.substr(0, kMostShownBytes));
    if (!rrule_text::parse(withInstant(rule, toUtc), &fields, &reason))
        throw Failure("its rule (RRULE): " + reason);
    return rrule_text::compose(fields);
}

std::string emailOf(const ContentLine& line) {
    if (std::string email = line.parameter("EMAIL"); !email.empty()) return email;
    const size_t start = line.value.find_first_not_of(' ');
    if (start == std::string::npos) return {};
    const std::string value = line.value.substr(start);
    const bool isMail = content_line::upper(value.substr(0, kMailto.size())) == kMailto;
    const std::string address = isMail ? value.substr(kMailto.size()) : value;
    if (!isMail && (address.find('@') == std::string::npos || address.find(':') != std::string::npos))
        return {};
    const GChars plain(g_uri_unescape_string(address.c_str(), nullptr));
    const bool isText = plain != nullptr && g_utf8_validate(plain.get(), -1, nullptr) != FALSE;
    return isText ? std::string(plain.get()) : address;
}

std::string addressOf(const std::string& email) {
    const GChars escaped(g_uri_escape_string(email.c_str(), kAddressCharacters, /*allow_utf8=*/TRUE));
    return std::string("mailto:") + escaped.get();
}

int64_t wallOf(const calendar_time_s& time) {
    if (!time_text::isDate(time)) return time.utime;
    const auto midnight = time_text::parseCompact(time_text::composeCompact(time) + "T000000Z");
    return midnight ? midnight->utime : 0;
}

calendar_time_s dateOf(int64_t wallSec) {
    calendar_time_s time;
    time.utime = wallSec;
    return time_text::parseCompact(time_text::composeCompact(time).substr(0, 8)).value_or(calendar_time_s{});
}

}  // namespace exchange::ical_values
