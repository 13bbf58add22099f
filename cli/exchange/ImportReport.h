// ImportReport.h: what has become of the items of a file.
#pragma once

#include <string>
#include <vector>

#include "Output.h"
#include "exchange/NotHeld.h"

namespace exchange {

enum class Skip {
    kSame,     // it is there already
    kDiffers,  // it is there, and says something else
    kOther,    // no kind that the place takes, or nothing at all
    kUnread,   // it cannot be read or held
};

class ImportReport {
public:
    void countRead() { ++mRead; }
    void countAdded(int count) { mAdded += count; }
    void countReplaced() { ++mReplaced; }
    void countGroup() { ++mGroups; }
    // `why` is empty for what needs no line of its own.
    void skip(Skip how, const std::string& title, size_t line, const std::string& why);
    void noteCut(size_t line) { mCutAt = line; }
    NotHeld& notHeld() { return mNotHeld; }

    // Everything in the file is on the device now, or was left out on purpose.
    [[nodiscard]] bool isWhole() const {
        return mCutAt == 0 && mSkipped[static_cast<size_t>(Skip::kUnread)] == 0;
    }
    // The details on standard error, the sum on standard output.
    void print(bool isJson, bool isDryRun) const;

private:
    [[nodiscard]] int skippedInAll() const;
    [[nodiscard]] Json json(bool isDryRun) const;
    [[nodiscard]] std::string text(bool isDryRun) const;

    struct Line {
        std::string title;
        size_t line;
        std::string why;
    };
    int mRead = 0;
    int mAdded = 0;
    int mReplaced = 0;
    int mGroups = 0;
    int mSkipped[4] = {};
    std::vector<Line> mLines;
    size_t mMoreLines = 0;
    size_t mCutAt = 0;
    NotHeld mNotHeld;
};

}  // namespace exchange
