// ItemReader.h: the items of a file, one at a time: the components of a calendar, or cards. Whatever is broken stays
// in its item.
#pragma once

#include <string>
#include <vector>

#include "exchange/LineReader.h"

namespace exchange {

enum class FileKind { kCalendar, kCards };

// A component with all its lines, those of the components inside it too.
struct RawItem {
    std::string name;  // "VEVENT", "VCARD" ...
    size_t firstLine = 0;
    std::vector<TextLine> lines;
    std::string problem;  // why it cannot be read; empty for none
};

// The title of an item that could not be read, for messages.
std::string titleOf(const RawItem& raw);

class ItemReader {
public:
    // Looks at the first line. A Failure when the file is neither of the kinds.
    explicit ItemReader(const std::string& path);

    [[nodiscard]] FileKind kind() const { return mKind; }
    // False at the end.
    bool next(RawItem* out);
    // After the end: where the file stops in the middle, 0 when it does not.
    [[nodiscard]] size_t cutAt() const { return mCutAt; }

private:
    // Whether the item is complete with this line.
    bool take(TextLine line, RawItem* item);
    bool begin(const std::string& name, const TextLine& line, RawItem* item);
    bool end(const std::string& name, RawItem* item);
    // Ends an item that was not closed.
    void breakOff(RawItem* item);

    LineReader mLines;
    FileKind mKind = FileKind::kCalendar;
    bool mIsInCalendar = false;
    std::vector<std::string> mOpen;  // the item's components that are not closed
    TextLine mAhead;                 // a line that begins the next item
    bool mHasAhead = false;
    size_t mCutAt = 0;
    size_t mLastLine = 0;
};

}  // namespace exchange
