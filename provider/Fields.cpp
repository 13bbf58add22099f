#include "Fields.h"

#include <algorithm>
#include <cctype>

namespace provider {

// list = item *("," item); item = name ["/" item | "(" list ")"]; name = "*" or letters, digits, "_", "-", "$"
class FieldsParser {
public:
    explicit FieldsParser(std::string_view text) : mText(text) {}

    Fields whole() {
        Fields fields = list(0);
        if (mAt != mText.size()) fail();
        return fields;
    }

private:
    using Part = std::pair<std::string, Fields>;
    static constexpr int kMaxDepth = 16;

    [[noreturn]] void fail() const {
        throw ApiError{400, "invalidParameter", "Invalid field selection " + std::string(mText), "fields"};
    }

    [[nodiscard]] bool take(char c) {
        if (mAt >= mText.size() || mText[mAt] != c) return false;
        ++mAt;
        return true;
    }

    std::string name() {
        if (take('*')) return "*";
        const std::size_t begin = mAt;
        const auto isName = [](unsigned char c) {
            return std::isalnum(c) || c == '_' || c == '-' || c == '$';
        };
        while (mAt < mText.size() && isName(static_cast<unsigned char>(mText[mAt]))) ++mAt;
        if (mAt == begin) fail();
        return std::string(mText.substr(begin, mAt - begin));
    }

    Fields list(int depth) {
        Fields fields;
        do add(fields, item(depth));
        while (take(','));
        return fields;
    }

    Part item(int depth) {
        if (depth > kMaxDepth) fail();
        Part part{name(), Fields{}};
        if (take('/')) {
            part.second.mChildren.push_back(item(depth + 1));
        } else if (take('(')) {
            part.second = list(depth + 1);
            if (!take(')')) fail();
        }
        return part;
    }

    // "a(b),a" is all of a, in either order.
    static void add(Fields& into, const Part& part) {
        for (auto& [known, fields] : into.mChildren) {
            if (known != part.first) continue;
            if (fields.all() || part.second.all()) {
                fields = Fields{};
            } else {
                for (const Part& inner : part.second.mChildren) add(fields, inner);
            }
            return;
        }
        into.mChildren.push_back(part);
    }

    std::string_view mText;
    std::size_t mAt = 0;
};

Fields Fields::parse(std::string_view text) {
    return text.empty() ? Fields{} : FieldsParser(text).whole();
}

const Fields* Fields::below(std::string_view member) const {
    static const Fields kAll;
    if (all()) return &kAll;
    for (const auto& [name, fields] : mChildren) {
        if (name == member || name == "*") return &fields;
    }
    return nullptr;
}

void Fields::allowOnly(std::initializer_list<std::string_view> known) const {
    for (const auto& [name, fields] : mChildren) {
        if (name != "*" && std::find(known.begin(), known.end(), name) == known.end()) {
            throw ApiError{400, "invalidParameter", "Invalid field selection " + name, "fields"};
        }
    }
}

Json Fields::apply(const Json& value) const {
    if (all()) return value;
    if (value.is_array()) {
        Json out = Json::array();
        for (const Json& element : value) out.push_back(apply(element));
        return out;
    }
    if (!value.is_object()) return value;
    Json out = Json::object();
    for (const auto& [name, member] : value.items()) {
        const Fields* fields = below(name);
        if (fields != nullptr) out[name] = fields->apply(member);
    }
    return out;
}

}  // namespace provider
