#include "exchange/ItemReader.h"

#include <algorithm>
#include <array>

#include "Failure.h"
#include "Output.h"
#include "exchange/ContentLine.h"

namespace exchange {

namespace {

constexpr std::string_view kBegin = "BEGIN:";
constexpr std::string_view kEnd = "END:";
constexpr std::string_view kCalendar = "VCALENDAR";
constexpr std::string_view kCard = "VCARD";
constexpr size_t kMostDepth = 8;
// An item is text, but for its photo.
constexpr size_t kMostItemBytes = size_t{64} * 1024 * 1024;

// Components that never stand inside another one, so that one of them tells that the former was not closed.
constexpr std::array<std::string_view, 6> kItems = {"VEVENT",    "VTODO",     "VJOURNAL",
                                                    "VFREEBUSY", "VTIMEZONE", kCard};

// The name behind "BEGIN:" or "END:", in capitals; empty for another line.
std::string nameBehind(std::string_view word, std::string_view line) {
    if (line.size() < word.size() || line.size() > word.size() + 128) return {};
    if (content_line::upper(line.substr(0, word.size())) != word) return {};
    std::string name = content_line::upper(line.substr(word.size()));
    name.erase(name.find_last_not_of(" \t") + 1);
    name.erase(0, name.find_first_not_of(" \t"));
    return name.empty() ? "?" : name;
}

bool isItem(std::string_view name) {
    return std::find(kItems.begin(), kItems.end(), name) != kItems.end();
}

// "AGENT:" of an older card holds a card.
bool isAgent(const std::vector<TextLine>& lines) {
    return !lines.empty() && content_line::upper(lines.back().text).starts_with("AGENT");
}

}  // namespace

std::string titleOf(const RawItem& raw) {
    for (const TextLine& line : raw.lines) {
        const auto parsed = content_line::parse(line.text);
        if (parsed && (parsed->name == "SUMMARY" || parsed->name == "FN"))
            return content_line::unescape(parsed->value);
    }
    return {};
}

ItemReader::ItemReader(const std::string& path) : mLines(path) {
    bool isThere = mLines.next(&mAhead);
    while (isThere && mAhead.text.find_first_not_of(" \t") == std::string::npos)
        isThere = mLines.next(&mAhead);
    const std::string name = isThere ? nameBehind(kBegin, mAhead.text) : std::string();
    const std::string shown = path == "-" ? "standard input" : path;
    if (!isThere) throw Failure(shown + " is empty; a calendar or cards are expected");
    if (name != kCalendar && name != kCard) {
        throw Failure(shown + " is neither a calendar nor cards: line " + std::to_string(mAhead.number) +
                      " is neither BEGIN:VCALENDAR nor BEGIN:VCARD");
    }
    mKind = name == kCard ? FileKind::kCards : FileKind::kCalendar;
    mHasAhead = true;
}

void ItemReader::breakOff(RawItem* item) {
    if (item->problem.empty()) item->problem = "it is not closed (END:" + item->name + " is missing)";
    mOpen.clear();
}

bool ItemReader::begin(const std::string& name, const TextLine& line, RawItem* item) {
    if (mOpen.empty()) {
        if (name == kCalendar) {
            mIsInCalendar = true;
            return false;
        }
        *item = {name, line.number, {}, ""};
        mOpen.push_back(name);
        return false;
    }
    const bool isNext = name == kCalendar || (isItem(name) && !(name == kCard && isAgent(item->lines)));
    if (isNext) {
        breakOff(item);
        mAhead = line;
        mHasAhead = true;
        return true;
    }
    mOpen.push_back(name);
    if (mOpen.size() > kMostDepth) item->problem = "components lie too deep inside each other";
    return false;
}

bool ItemReader::end(const std::string& name, RawItem* item) {
    if (mOpen.empty()) {
        if (name == kCalendar) mIsInCalendar = false;
        return false;
    }
    if (name == mOpen.back()) {
        mOpen.pop_back();
        return mOpen.empty();
    }
    const bool isOfItem = name == item->name || name == kCalendar;
    if (!isOfItem) {
        item->problem = "END:" + name + " closes nothing";
        return false;
    }
    breakOff(item);
    if (name == kCalendar) mIsInCalendar = false;
    return true;
}

bool ItemReader::take(TextLine line, RawItem* item) {
    mLastLine = line.number;
    const bool isInItem = !mOpen.empty();
    bool isDone = false;
    if (const std::string begun = nameBehind(kBegin, line.text); !begun.empty()) {
        isDone = begin(begun, line, item);
        if (isDone || !isInItem) return isDone;
    } else if (const std::string ended = nameBehind(kEnd, line.text); !ended.empty()) {
        isDone = end(ended, item);
        if (isDone || !isInItem) return isDone;
    }
    if (!isInItem || mOpen.size() > kMostDepth || !item->problem.empty()) return false;
    item->lines.push_back(std::move(line));
    return false;
}

bool ItemReader::next(RawItem* out) {
    *out = {};
    mOpen.clear();
    size_t bytes = 0;
    TextLine line;
    for (;;) {
        if (mHasAhead) {
            line = std::move(mAhead);
            mHasAhead = false;
        } else if (!mLines.next(&line)) {
            break;
        }
        bytes = mOpen.empty() ? 0 : bytes + line.text.size();
        if (take(std::move(line), out)) return true;
        if (bytes > kMostItemBytes && out->problem.empty()) {
            out->problem = "it is larger than " + std::to_string(kMostItemBytes >> 20) + " MB";
            out->lines = {};
        }
    }
    if (mOpen.empty()) {
        if (mIsInCalendar) mCutAt = mLastLine;
        return false;
    }
    mCutAt = mLastLine;
    mIsInCalendar = false;
    breakOff(out);
    return true;
}

}  // namespace exchange
