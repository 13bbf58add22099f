#include "exchange/ImportReport.h"

#include <cstdio>
#include <numeric>

namespace exchange {

namespace {

constexpr size_t kMostLines = 200;
constexpr size_t kMostTitleBytes = 200;

struct SkipName {
    const char* member;  // of the JSON
    const char* text;
};
// In the order of Skip.
constexpr SkipName kSkipNames[] = {{"same", "already there"},
                                   {"differs", "different from what is there"},
                                   {"otherKind", "of another kind"},
                                   {"unreadable", "not readable"}};

}  // namespace

void ImportReport::skip(Skip how, const std::string& title, size_t line, const std::string& why) {
    ++mSkipped[static_cast<size_t>(how)];
    if (why.empty()) return;
    if (mLines.size() < kMostLines) {
        mLines.push_back({output::printable(title.substr(0, kMostTitleBytes)), line, why});
    } else {
        ++mMoreLines;
    }
}

int ImportReport::skippedInAll() const {
    return std::accumulate(std::begin(mSkipped), std::end(mSkipped), 0);
}

Json ImportReport::json(bool isDryRun) const {
    Json skipped = Json::object();
    for (size_t at = 0; at < std::size(kSkipNames); ++at) skipped[kSkipNames[at].member] = mSkipped[at];
    Json lines = Json::array();
    for (const Line& line : mLines)
        lines.push_back({{"title", line.title}, {"line", line.line}, {"reason", line.why}});
    return {{"read", mRead},
            {"added", mAdded},
            {"replaced", mReplaced},
            {"groupsAdded", mGroups},
            {"skipped", skipped},
            {"items", lines},
            {"notHeld", mNotHeld.json()},
            {"cutAtLine", mCutAt > 0 ? Json(mCutAt) : Json()},
            {"dryRun", isDryRun}};
}

std::string ImportReport::text(bool isDryRun) const {
    std::string text = isDryRun ? "nothing was written; " : "";
    text += std::to_string(mRead) + " read: " + std::to_string(mAdded) + (isDryRun ? " to add" : " added");
    if (mReplaced > 0) text += ", " + std::to_string(mReplaced) + (isDryRun ? " to replace" : " replaced");
    text += ", " + std::to_string(skippedInAll()) + " skipped";
    std::string reasons;
    for (size_t at = 0; at < std::size(kSkipNames); ++at) {
        if (mSkipped[at] == 0) continue;
        reasons += (reasons.empty() ? "" : ", ") + std::to_string(mSkipped[at]) + " " + kSkipNames[at].text;
    }
    if (!reasons.empty()) text += " (" + reasons + ")";
    if (mGroups > 0) text += ", " + std::to_string(mGroups) + (isDryRun ? " groups to make" : " groups made");
    return text;
}

void ImportReport::print(bool isJson, bool isDryRun) const {
    for (const Line& line : mLines)
        std::fprintf(stderr, "skipped \"%s\" (line %zu): %s\n", line.title.c_str(), line.line,
                     output::printable(line.why).c_str());
    if (mMoreLines > 0) std::fprintf(stderr, "skipped %zu more\n", mMoreLines);
    mNotHeld.print("not held on this device, left out:");
    if (mCutAt > 0)
        std::fprintf(stderr, "the file ends in the middle, at line %zu; what stands before it was read\n",
                     mCutAt);
    isJson ? output::json(json(isDryRun)) : output::line(text(isDryRun));
}

}  // namespace exchange
