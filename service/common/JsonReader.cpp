#include "common/JsonReader.h"

#include <array>
#include <charconv>
#include <cmath>
#include <optional>
#include <string>
#include <utility>

namespace json_reader {

namespace {

constexpr gunichar kReplacement = 0xFFFD;

// What ends the run of bytes of a string that are taken as they are.
constexpr std::array<bool, 256> kEndsRun = [] {
    std::array<bool, 256> ends{};
    for (size_t c = 0; c < 0x20; ++c) ends[c] = true;
    ends['"'] = ends['\\'] = true;
    return ends;
}();

constexpr size_t kDigits = 4;  // of an escaped UTF-16 code unit

constexpr bool isHighHalf(unsigned code) {
    return code >= 0xD800 && code < 0xDC00;
}
constexpr bool isLowHalf(unsigned code) {
    return code >= 0xDC00 && code < 0xE000;
}

JsonNodePtr valueNode() {
    return JsonNodePtr(json_node_new(JSON_NODE_VALUE));
}

class Reader {
public:
    explicit Reader(std::string_view text) : mAt(text.data()), mEnd(text.data() + text.size()) {}

    JsonNodePtr document() {
        skipSpace();
        JsonNodePtr root = value(0);
        skipSpace();
        return mAt == mEnd ? std::move(root) : nullptr;
    }

private:
    [[nodiscard]] std::string_view rest() const { return {mAt, static_cast<size_t>(mEnd - mAt)}; }

    bool take(char c) {
        if (mAt == mEnd || *mAt != c) return false;
        ++mAt;
        return true;
    }

    bool takeWord(std::string_view word) {
        if (!rest().starts_with(word)) return false;
        mAt += word.size();
        return true;
    }

    void skipSpace() {
        while (mAt != mEnd && (*mAt == ' ' || *mAt == '\n' || *mAt == '\r' || *mAt == '\t')) ++mAt;
    }

    JsonNodePtr value(int depth) {
        if (depth > kMaxDepth || mAt == mEnd) return nullptr;
        switch (*mAt) {
            case '{':
                return object(depth);
            case '[':
                return array(depth);
            case '"': {
                if (!string()) return nullptr;
                JsonNodePtr node = valueNode();
                json_node_set_string(node.get(), mText.c_str());
                return node;
            }
            case 't':
            case 'f': {
                const bool isTrue = *mAt == 't';
                if (!takeWord(isTrue ? "true" : "false")) return nullptr;
                JsonNodePtr node = valueNode();
                json_node_set_boolean(node.get(), isTrue ? TRUE : FALSE);
                return node;
            }
            case 'n':
                return takeWord("null") ? JsonNodePtr(json_node_new(JSON_NODE_NULL)) : nullptr;
            default:
                return number();
        }
    }

    JsonNodePtr object(int depth) {
        take('{');
        JsonObjectPtr object(json_object_new());
        std::string name;
        skipSpace();
        if (!take('}')) {
            do {
                skipSpace();
                if (!string()) return nullptr;
                name.assign(mText);
                skipSpace();
                if (!take(':')) return nullptr;
                skipSpace();
                JsonNodePtr member = value(depth + 1);
                if (!member) return nullptr;
                json_object_set_member(object.get(), name.c_str(), member.release());
                skipSpace();
            } while (take(','));
            if (!take('}')) return nullptr;
        }
        JsonNodePtr node(json_node_new(JSON_NODE_OBJECT));
        json_node_take_object(node.get(), object.release());
        return node;
    }

    JsonNodePtr array(int depth) {
        take('[');
        JsonArrayPtr array(json_array_new());
        skipSpace();
        if (!take(']')) {
            do {
                skipSpace();
                JsonNodePtr element = value(depth + 1);
                if (!element) return nullptr;
                json_array_add_element(array.get(), element.release());
                skipSpace();
            } while (take(','));
            if (!take(']')) return nullptr;
        }
        JsonNodePtr node(json_node_new(JSON_NODE_ARRAY));
        json_node_take_array(node.get(), array.release());
        return node;
    }

    // Into mText.
    bool string() {
        mText.clear();
        if (!take('"')) return false;
        bool isAscii = true;
        const char* const begin = mAt;
        while (true) {
            const char* const run = mAt;
            unsigned char bits = 0;
            while (mAt != mEnd && !kEndsRun[static_cast<unsigned char>(*mAt)])
                bits |= static_cast<unsigned char>(*mAt++);
            isAscii = isAscii && bits < 0x80;
            mText.append(run, mAt);
            if (mAt == mEnd) return false;
            const char c = *mAt++;
            if (c == '"') break;
            if (c != '\\' || !escape()) return false;
        }
        return isAscii || g_utf8_validate(begin, mAt - 1 - begin, nullptr) != FALSE;
    }

    bool escape() {
        constexpr std::string_view kNames = "\"\\/bfnrt";
        constexpr std::string_view kMeant = "\"\\/\b\f\n\r\t";
        if (mAt == mEnd) return false;
        const char name = *mAt++;
        if (name == 'u') return unicodeEscape();
        const size_t which = kNames.find(name);
        if (which == std::string_view::npos) return false;
        mText += kMeant[which];
        return true;
    }

    // What the four digits at the front say.
    static std::optional<unsigned> codeUnit(std::string_view text) {
        constexpr int kBase = 16;
        unsigned code = 0;
        if (text.size() < kDigits) return std::nullopt;
        const auto [end, error] = std::from_chars(text.data(), text.data() + kDigits, code, kBase);
        if (error != std::errc() || end != text.data() + kDigits) return std::nullopt;
        return code;
    }

    bool unicodeEscape() {
        constexpr std::string_view kEscape = "\\u";
        const std::optional<unsigned> first = codeUnit(rest());
        if (!first) return false;
        mAt += kDigits;
        gunichar code = *first;
        if (isLowHalf(*first)) {
            code = kReplacement;
        } else if (isHighHalf(*first)) {
            const std::optional<unsigned> second =
                rest().starts_with(kEscape) ? codeUnit(rest().substr(kEscape.size())) : std::nullopt;
            if (second && isLowHalf(*second)) {
                code = 0x10000 + ((*first - 0xD800) << 10) + (*second - 0xDC00);
                mAt += kEscape.size() + kDigits;
            } else {
                code = kReplacement;
            }
        }
        char bytes[6];
        mText.append(bytes, static_cast<size_t>(g_unichar_to_utf8(code, bytes)));
        return true;
    }

    bool digits() {
        const char* const begin = mAt;
        while (mAt != mEnd && *mAt >= '0' && *mAt <= '9') ++mAt;
        return mAt != begin;
    }

    JsonNodePtr number() {
        const char* const begin = mAt;
        bool isInteger = true;
        take('-');
        if (!take('0') && !digits()) return nullptr;
        if (take('.')) {
            isInteger = false;
            if (!digits()) return nullptr;
        }
        if (take('e') || take('E')) {
            isInteger = false;
            if (!take('+')) take('-');
            if (!digits()) return nullptr;
        }
        JsonNodePtr node = valueNode();
        if (isInteger) {
            int64_t whole = 0;
            if (std::from_chars(begin, mAt, whole).ec != std::errc()) return nullptr;
            json_node_set_int(node.get(), whole);
            return node;
        }
        const double real = g_ascii_strtod(std::string(begin, mAt).c_str(), nullptr);
        if (!std::isfinite(real)) return nullptr;
        json_node_set_double(node.get(), real);
        return node;
    }

    const char* mAt;
    const char* const mEnd;
    std::string mText;  // the last string
};

}  // namespace

JsonNodePtr read(std::string_view text) {
    return Reader(text).document();
}

}  // namespace json_reader
