// The exception dates of a series: recurrence ids of its cancelled instances, joined with ", ", each once.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace exception_dates {

inline std::vector<std::string> split(std::string_view dates) {
    std::vector<std::string> parts;
    while (!dates.empty()) {
        const size_t end = dates.find(',');
        std::string_view part = dates.substr(0, end);
        while (!part.empty() && part.front() == ' ') part.remove_prefix(1);
        while (!part.empty() && part.back() == ' ') part.remove_suffix(1);
        if (!part.empty()) parts.emplace_back(part);
        if (end == std::string_view::npos) break;
        dates.remove_prefix(end + 1);
    }
    return parts;
}

inline std::string join(const std::vector<std::string>& parts) {
    std::string dates;
    for (const std::string& part : parts) {
        if (!dates.empty()) dates += ", ";
        dates += part;
    }
    return dates;
}

inline bool contains(std::string_view dates, std::string_view date) {
    for (const std::string& part : split(dates)) {
        if (part == date) return true;
    }
    return false;
}

inline std::string with(const std::string& dates, const std::string& date) {
    if (contains(dates, date)) return dates;
    return dates.empty() ? date : dates + ", " + date;
}

inline std::string without(const std::string& dates, const std::string& date) {
    std::vector<std::string> parts = split(dates);
    if (std::erase(parts, date) == 0) return dates;
    return join(parts);
}

}  // namespace exception_dates
