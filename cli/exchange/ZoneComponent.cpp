#include "exchange/ZoneComponent.h"

#include <unicode/vtzone.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string_view>

#include "TimeText.h"

namespace exchange::zone_component {

namespace {

constexpr double kMsPerSecond = 1000;
constexpr std::string_view kOffset = "TZOFFSET";
constexpr std::string_view kOffsetFrom = "TZOFFSETFROM:";
constexpr std::string_view kUntil = "UNTIL=";
constexpr size_t kLongOffsetBytes = 7;
constexpr size_t kWallTimeBytes = 15;

// Seconds of "+0130" or "+013000".
int64_t offsetSec(const std::string& text) {
    const std::string digits = text.substr(std::min<size_t>(1, text.size())) + "00";
    constexpr size_t kDigits = 6;
    if (digits.size() < kDigits) return 0;
    const auto pair = [&digits](size_t at) { return std::strtol(digits.substr(at, 2).c_str(), nullptr, 10); };
    const int64_t seconds = pair(0) * 3600 + pair(2) * 60 + pair(4);
    return text.starts_with('-') ? -seconds : seconds;
}

std::string offsetText(int64_t seconds) {
    std::array<char, 32> text{};
    const int64_t size = std::abs(seconds);
    std::snprintf(text.data(), text.size(), size % 60 != 0 ? "%c%02d%02d%02d" : "%c%02d%02d",
                  seconds < 0 ? '-' : '+', static_cast<int>(size / 3600), static_cast<int>(size / 60 % 60),
                  static_cast<int>(size % 60));
    return text.data();
}

// The end of a rule as an instant. `offset` is what holds before the change.
void makeInstant(std::string& line, int64_t offset) {
    const size_t until = line.find(kUntil);
    if (until == std::string::npos) return;
    const size_t start = until + kUntil.size();
    auto time = time_text::parseCompact(line.substr(start, kWallTimeBytes) + "Z");
    if (!time || line.compare(start + kWallTimeBytes, 1, "Z") == 0) return;
    time->utime -= offset;
    line.replace(start, kWallTimeBytes, time_text::composeCompact(*time));
}

// As the ICU library writes a zone, but as readers want it: the end of a rule is an instant, an offset has seconds
// only where it needs them, and nothing is the library's own.
std::string asReadersWantIt(const std::string& component) {
    std::string out;
    int64_t from = 0;
    for (size_t at = 0; at < component.size();) {
        const size_t end = std::min(component.find("\r\n", at), component.size());
        std::string line = component.substr(at, end - at);
        at = end + 2;
        const size_t colon = line.find(':');
        if (line.starts_with("X-TZINFO") || colon == std::string::npos) continue;
        const bool isLong = line.starts_with(kOffset) && line.size() - colon - 1 == kLongOffsetBytes;
        if (isLong && line.ends_with("00")) line.resize(line.size() - 2);
        if (line.starts_with(kOffsetFrom)) from = offsetSec(line.substr(kOffsetFrom.size()));
        makeInstant(line, from);
        out += line + "\r\n";
    }
    return out;
}

// The library begins with the first change; this is what holds until then.
std::string initial(int64_t firstWallSec, int64_t offset) {
    calendar_time_s start;
    start.utime = firstWallSec;
    std::string wall = time_text::composeCompact(start);
    wall.pop_back();  // the Z
    const std::string text = offsetText(offset);
    return "BEGIN:STANDARD\r\nTZOFFSETTO:" + text + "\r\nTZOFFSETFROM:" + text + "\r\nDTSTART:" + wall +
           "\r\nEND:STANDARD\r\n";
}

}  // namespace

std::string compose(const std::string& name, int64_t firstSec, int64_t firstWallSec) {
    const std::unique_ptr<icu::VTimeZone> zone(
        icu::VTimeZone::createVTimeZoneByID(icu::UnicodeString::fromUTF8(name)));
    if (zone == nullptr) return {};
    UErrorCode error = U_ZERO_ERROR;
    icu::UnicodeString text;
    zone->write(static_cast<double>(firstSec) * kMsPerSecond, text, error);
    if (U_FAILURE(error)) return {};
    std::string plain;
    std::string component = asReadersWantIt(text.toUTF8String(plain));
    const size_t place = component.find("BEGIN:", 1);
    if (place == std::string::npos) return {};
    return component.insert(place, initial(firstWallSec, firstWallSec - firstSec));
}

}  // namespace exchange::zone_component
