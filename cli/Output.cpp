#include "Output.h"

#include <glib.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <numeric>
#include <sstream>
#include <utility>

#include "Failure.h"
#include "Handles.h"

namespace output {

namespace {

constexpr std::string_view kGap = "  ";
constexpr size_t kNarrowest = 4;  // of a column that is cut
constexpr const char* kCut = "…";

void write(std::string_view text) {
    if (std::fwrite(text.data(), 1, text.size(), stdout) != text.size()) {
        throw Failure("standard output cannot be written; check its disk or its reader");
    }
}

void flush() {
    if (std::fflush(stdout) != 0) {
        throw Failure("standard output cannot be written; check its disk or its reader");
    }
}

size_t widthOf(gunichar character) {
    if (g_unichar_iszerowidth(character) != 0) return 0;
    return g_unichar_iswide(character) != 0 ? 2 : 1;
}

// Text that came from a database may be damaged; a list must not end in the middle because of it.
std::string dump(const Json& value, int indent) {
    return value.dump(indent, ' ', false, Json::error_handler_t::replace);
}

std::string plain(const Json& value) {
    return printable(value.is_string() ? value.get<std::string>() : dump(value, -1));
}

bool isBlank(const Json& value) {
    if (value.is_null()) return true;
    if (value.is_string()) return value.get_ref<const std::string&>().empty();
    if (value.is_object()) return std::all_of(value.begin(), value.end(), isBlank);
    return value.is_array() && value.empty();
}

// An object of a list or a member on one line: its values that say something.
std::string flat(const Json& value) {
    if (!value.is_object()) return plain(value);
    std::string text;
    for (const auto& member : value.items()) {
        if (isBlank(member.value())) continue;
        if (!text.empty()) text += ", ";
        text += member.key() + " " + flat(member.value());
    }
    return text;
}

}  // namespace

void line(std::string_view text) {
    write(text);
    write("\n");
    flush();
}

void raw(std::string_view text) {
    write(text);
    flush();
}

void json(const Json& value) {
    line(dump(value, 2));
}

JsonArray::JsonArray() {
    write("[");
}

void JsonArray::add(const Json& element) {
    write(mIsEmpty ? "\n" : ",\n");
    write(dump(element, -1));
    mIsEmpty = false;
}

void JsonArray::end() {
    write(mIsEmpty ? "]\n" : "\n]\n");
    flush();
}

Table::Table(std::vector<std::string> headers) {
    add(std::move(headers));
}

void Table::add(std::vector<std::string> cells) {
    for (std::string& cell : cells) cell = printable(cell);
    std::vector<terminal::Colour> colours(cells.size(), terminal::Colour::kNone);
    mRows.push_back({std::move(cells), std::move(colours)});
}

void Table::colour(size_t column, terminal::Colour colour) {
    mRows.back().colours.at(column) = colour;
}

std::vector<size_t> Table::widths(size_t columns) const {
    std::vector<size_t> widths(mRows.front().cells.size(), 0);
    for (const Row& row : mRows) {
        for (size_t column = 0; column < row.cells.size(); ++column) {
            widths[column] = std::max(widths[column], displayWidth(row.cells[column]));
        }
    }
    const auto total = [&widths] {
        return std::accumulate(widths.begin(), widths.end(), kGap.size() * (widths.size() - 1));
    };
    while (columns != 0 && total() > columns) {
        size_t& widest = *std::max_element(widths.begin(), widths.end());
        if (widest <= kNarrowest) return {};
        --widest;
    }
    return widths;
}

std::string Table::text(size_t columns) const {
    const std::vector<size_t> widths = this->widths(columns);
    if (widths.empty()) return lists();
    std::string text;
    for (const Row& row : mRows) {
        size_t blanks = 0;  // before the next cell that shows something, so that no line ends with them
        for (size_t column = 0; column < row.cells.size(); ++column) {
            const std::string cell = shortened(row.cells[column], widths[column]);
            if (!cell.empty()) {
                text.append(std::exchange(blanks, 0), ' ');
                text += terminal::coloured(cell, row.colours[column]);
            }
            blanks += widths[column] - displayWidth(cell) + kGap.size();
        }
        text += "\n";
    }
    return text;
}

std::string Table::lists() const {
    const std::vector<std::string>& headers = mRows.front().cells;
    std::string text;
    for (size_t row = 1; row < mRows.size(); ++row) {
        if (row > 1) text += "\n";
        for (size_t column = 0; column < headers.size(); ++column) {
            const std::string& cell = mRows[row].cells[column];
            if (cell.empty()) continue;
            text += headers[column] + ": " + terminal::coloured(cell, mRows[row].colours[column]) + "\n";
        }
    }
    return text;
}

void Table::print() const {
    raw(text(terminal::columns()));
}

void fields(const Json& object) {
    for (const auto& member : object.items()) {
        if (isBlank(member.value())) continue;
        if (!member.value().is_array()) {
            write(member.key() + ": " + flat(member.value()) + "\n");
            continue;
        }
        write(member.key() + ":\n");
        for (const Json& element : member.value()) write("  " + flat(element) + "\n");
    }
    flush();
}

std::string printable(std::string_view text) {
    if (text.empty()) return {};
    const GChars valid(g_utf8_make_valid(text.data(), static_cast<gssize>(text.size())));
    std::string out;
    for (const char* at = valid.get(); *at != '\0'; at = g_utf8_next_char(at)) {
        if (g_unichar_iscntrl(g_utf8_get_char(at)) != 0) {
            out += ' ';
        } else {
            out.append(static_cast<const char*>(at), static_cast<size_t>(g_utf8_next_char(at) - at));
        }
    }
    return out;
}

size_t displayWidth(std::string_view text) {
    if (text.empty()) return 0;
    const GChars valid(g_utf8_make_valid(text.data(), static_cast<gssize>(text.size())));
    size_t width = 0;
    for (const char* at = valid.get(); *at != '\0'; at = g_utf8_next_char(at)) {
        width += widthOf(g_utf8_get_char(at));
    }
    return width;
}

std::string shortened(const std::string& text, size_t columns) {
    if (displayWidth(text) <= columns) return text;
    const GChars valid(g_utf8_make_valid(text.data(), static_cast<gssize>(text.size())));
    const char* at = valid.get();
    size_t width = displayWidth(kCut);
    for (; *at != '\0'; at = g_utf8_next_char(at)) {
        width += widthOf(g_utf8_get_char(at));
        if (width > columns) break;
    }
    return columns == 0 ? std::string() : std::string(static_cast<const char*>(valid.get()), at) + kCut;
}

std::string wrapped(std::string_view text, size_t columns, size_t indent) {
    const std::string margin(indent, ' ');
    std::string out = margin;
    size_t width = indent;
    std::istringstream words{std::string(text)};
    for (std::string word; words >> word;) {
        const size_t wide = displayWidth(word);
        const bool isFirst = width == indent;
        if (!isFirst && columns != 0 && width + 1 + wide > columns) {
            out.append("\n").append(margin).append(word);
            width = indent + wide;
            continue;
        }
        out += (isFirst ? "" : " ") + word;
        width += wide + (isFirst ? 0 : 1);
    }
    return out;
}

namespace {

bool isPassing = false;  // the last text on standard error is one that the next replaces

void show(std::string_view text, bool passes) {
    if (isatty(STDERR_FILENO) == 0) return;
    const std::string line = printable(text);
    // The line is cleared only where something stands that is to be replaced.
    std::fprintf(stderr, "%s%s%s", isPassing ? "\r\033[K" : "", line.c_str(), passes ? "" : "\n");
    std::fflush(stderr);
    isPassing = passes && !line.empty();
}

}  // namespace

void progress(std::string_view text) {
    show(text, /*passes=*/false);
}

void passingProgress(std::string_view text) {
    const size_t columns = terminal::columns();
    // A line that wraps could not be replaced.
    show(columns > 1 ? shortened(std::string(text), columns - 1) : std::string(text), /*passes=*/true);
}

}  // namespace output
