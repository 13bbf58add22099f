// Output.h: what the tool prints: JSON for scripts, tables for people. Standard output carries results only.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <string_view>
#include <vector>

#include "Terminal.h"

// Keeps members in the order in which the documentation lists them.
using Json = nlohmann::ordered_json;

namespace output {

// A Failure when standard output cannot take it (a full disk, a closed pipe).
void line(std::string_view text);
// As it is, without a line end.
void raw(std::string_view text);
void json(const Json& value);

// An array whose elements are written as they come, one a line, so that a long list needs no memory.
class JsonArray {
public:
    JsonArray();
    void add(const Json& element);
    void end();

private:
    bool mIsEmpty = true;
};

// A table for people: columns as wide as their widest cell on the screen, two blanks between them. Where the line is
// shorter than that, the widest columns are cut; where it is too short for that too, each row is a list of its cells.
class Table {
public:
    explicit Table(std::vector<std::string> headers);
    void add(std::vector<std::string> cells);
    // Of a cell of the row that was added last.
    void colour(size_t column, terminal::Colour colour);
    void print() const;
    // `columns` 0: lines as long as they need to be.
    [[nodiscard]] std::string text(size_t columns = 0) const;

private:
    struct Row {
        std::vector<std::string> cells;
        std::vector<terminal::Colour> colours;
    };
    [[nodiscard]] std::vector<size_t> widths(size_t columns) const;
    [[nodiscard]] std::string lists() const;

    std::vector<Row> mRows;
};

// "NAME: value" lines, without the members that are empty. Elements of lists stand on lines of their own.
void fields(const Json& object);

// Text from outside made harmless for a terminal: one line, no control characters, valid UTF-8.
std::string printable(std::string_view text);
// Columns that the text takes on a terminal.
size_t displayWidth(std::string_view text);
// Cut at `columns`, with a mark where something is left out.
std::string shortened(const std::string& text, size_t columns);
// Broken at blanks into lines of at most `columns` (0: one line), each begun with `indent` blanks.
std::string wrapped(std::string_view text, size_t columns, size_t indent);

// Where something stands, for people only: standard error, and only when it is a terminal.
void progress(std::string_view text);
// Replaced by the next one and by progress(); an empty text only clears.
void passingProgress(std::string_view text);

}  // namespace output
