#include "Output.h"

#include <glib.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>

#include "Failure.h"
#include "Handles.h"

namespace output {

namespace {

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
    mRows.push_back(std::move(headers));
}

void Table::add(std::vector<std::string> cells) {
    for (std::string& cell : cells) cell = printable(cell);
    mRows.push_back(std::move(cells));
}

std::string Table::text() const {
    std::vector<size_t> widths(mRows.front().size(), 0);
    for (const auto& row : mRows) {
        for (size_t column = 0; column < row.size(); ++column) {
            widths[column] = std::max(widths[column], displayWidth(row[column]));
        }
    }
    std::string text;
    for (const auto& row : mRows) {
        std::string rowText;
        for (size_t column = 0; column < row.size(); ++column) {
            rowText += row[column];
            rowText.append(widths[column] - displayWidth(row[column]) + 2, ' ');
        }
        rowText.erase(rowText.find_last_not_of(' ') + 1);
        text += rowText + "\n";
    }
    return text;
}

void Table::print() const {
    write(text());
    flush();
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
        const gunichar character = g_utf8_get_char(at);
        if (g_unichar_iszerowidth(character) != 0) continue;
        width += g_unichar_iswide(character) != 0 ? 2 : 1;
    }
    return width;
}

void progress(std::string_view text) {
    if (isatty(STDERR_FILENO) == 0) return;
    std::fprintf(stderr, "%.*s\n", static_cast<int>(text.size()), text.data());
}

}  // namespace output
