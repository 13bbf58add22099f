// Output.h: what the tool prints: JSON for scripts, tables for people. Standard output carries results only.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <string_view>
#include <vector>

// Keeps members in the order in which the documentation lists them.
using Json = nlohmann::ordered_json;

namespace output {

// A Failure when standard output cannot take it (a full disk, a closed pipe).
void line(std::string_view text);
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

// A table for people: columns as wide as their widest cell on the screen, two blanks between them.
class Table {
public:
    explicit Table(std::vector<std::string> headers);
    void add(std::vector<std::string> cells);
    void print() const;
    [[nodiscard]] std::string text() const;

private:
    std::vector<std::vector<std::string>> mRows;
};

// "NAME: value" lines, without the members that are empty. Elements of lists stand on lines of their own.
void fields(const Json& object);

// Text from outside made harmless for a terminal: one line, no control characters, valid UTF-8.
std::string printable(std::string_view text);
// Columns that the text takes on a terminal.
size_t displayWidth(std::string_view text);

// Where something stands, for people only: standard error, and only when it is a terminal.
void progress(std::string_view text);

}  // namespace output
