#include "common/JsonSyntax.h"

#include <glib.h>

#include <charconv>
#include <cmath>
#include <string>

namespace json_syntax {

namespace {

class Checker {
public:
    Checker(std::string_view text, std::vector<size_t>* lone) : mText(text), mRest(text), mpLone(lone) {}

    bool document() {
        skipSpace();
        if (!value(0)) return false;
        skipSpace();
        return mRest.empty();
    }

private:
    [[nodiscard]] char peek() const { return mRest.empty() ? '\0' : mRest.front(); }

    bool take(char c) {
        if (mRest.empty() || mRest.front() != c) return false;
        mRest.remove_prefix(1);
        return true;
    }

    bool takeWord(std::string_view word) {
        if (!mRest.starts_with(word)) return false;
        mRest.remove_prefix(word.size());
        return true;
    }

    // Every page goes through here, so the lengths are counted in plain loops.
    template <class Is>
    size_t skip(Is is) {
        size_t length = 0;
        while (length < mRest.size() && is(mRest[length])) ++length;
        mRest.remove_prefix(length);
        return length;
    }

    void skipSpace() {
        skip([](char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; });
    }

    bool value(int depth) {
        if (depth > kMaxDepth) return false;
        switch (peek()) {
            case '{':
                return container(depth, '{', '}');
            case '[':
                return container(depth, '[', ']');
            case '"':
                return string();
            case 't':
                return takeWord("true");
            case 'f':
                return takeWord("false");
            case 'n':
                return takeWord("null");
            default:
                return number();
        }
    }

    bool container(int depth, char open, char close) {
        take(open);
        skipSpace();
        if (take(close)) return true;
        do {
            skipSpace();
            if (open == '{') {
                if (!string()) return false;
                skipSpace();
                if (!take(':')) return false;
                skipSpace();
            }
            if (!value(depth + 1)) return false;
            skipSpace();
        } while (take(','));
        return take(close);
    }

    bool string() {
        if (!take('"')) return false;
        constexpr unsigned char kFirstText = 0x20;
        do {
            skip([](char c) { return c != '"' && c != '\\' && static_cast<unsigned char>(c) >= kFirstText; });
            if (take('"')) return true;
        } while (take('\\') && escape());
        return false;
    }

    bool escape() {
        if (mRest.empty()) return false;
        const char c = mRest.front();
        mRest.remove_prefix(1);
        if (c != 'u') return std::string_view("\"\\/bfnrt").find(c) != std::string_view::npos;
        constexpr size_t kHexDigits = 4;
        if (mRest.size() < kHexDigits) return false;
        const std::string_view digits = mRest.substr(0, kHexDigits);
        if (digits.find_first_not_of("0123456789abcdefABCDEF") != std::string_view::npos) return false;
        noteSurrogate(digits);
        mRest.remove_prefix(kHexDigits);
        return true;
    }

    // With `digits`, of an escape that is one, still at the front of the rest.
    void noteSurrogate(std::string_view digits) {
        constexpr size_t kEscapeLength = sizeof("\\uD83D") - 1;
        const auto isHalf = [](std::string_view half, std::string_view thirds) {
            return (half[0] == 'd' || half[0] == 'D') && thirds.find(half[1]) != std::string_view::npos;
        };
        constexpr std::string_view kHigh = "89abAB";
        constexpr std::string_view kLow = "cdefCDEF";
        const auto at = static_cast<size_t>(digits.data() - mText.data()) - 2;
        if (isHalf(digits, kLow)) {
            if (mHighEnd != at) mpLone->push_back(at);
        } else if (isHalf(digits, kHigh)) {
            const std::string_view next = mText.substr(at + kEscapeLength, kEscapeLength);
            const bool isPair =
                next.size() == kEscapeLength && next.starts_with("\\u") && isHalf(next.substr(2), kLow);
            if (isPair) {
                mHighEnd = at + kEscapeLength;
            } else {
                mpLone->push_back(at);
            }
        }
    }

    bool digits() {
        return skip([](char c) { return c >= '0' && c <= '9'; }) > 0;
    }

    bool number() {
        const std::string_view from = mRest;
        bool isInteger = true;
        take('-');
        if (!take('0') && !digits()) return false;
        if (take('.')) {
            isInteger = false;
            if (!digits()) return false;
        }
        if (take('e') || take('E')) {
            isInteger = false;
            if (!take('+')) take('-');
            if (!digits()) return false;
        }
        return isHeld(from.substr(0, from.size() - mRest.size()), isInteger);
    }

    // The parser makes another number, or none, of what its types cannot hold.
    static bool isHeld(std::string_view number, bool isInteger) {
        int64_t value = 0;
        if (isInteger)
            return std::from_chars(number.data(), number.data() + number.size(), value).ec == std::errc();
        return std::isfinite(g_ascii_strtod(std::string(number).c_str(), nullptr));
    }

    const std::string_view mText;
    std::string_view mRest;
    std::vector<size_t>* const mpLone;
    size_t mHighEnd = 0;  // where the second half of a pair has to begin
};

}  // namespace

bool isValid(std::string_view text, std::vector<size_t>* lone) {
    return Checker(text, lone).document();
}

}  // namespace json_syntax
