#include "ListPart.h"

#include <unicode/unistr.h>

#include <algorithm>

namespace provider {

namespace {

constexpr long long kMaxLimit = 500;

icu::UnicodeString folded(const std::string& text) {
    return icu::UnicodeString::fromUTF8(text).foldCase();
}

class Words {
public:
    explicit Words(const std::string& text) {
        for (const std::string& word : splitText(text, ' ')) {
            if (!word.empty()) mWords.push_back(folded(word));
        }
    }
    [[nodiscard]] bool isEmpty() const { return mWords.empty(); }
    [[nodiscard]] bool areIn(const std::string& text) const {
        const icu::UnicodeString where = folded(text);
        return std::all_of(mWords.begin(), mWords.end(),
                           [&](const icu::UnicodeString& word) { return where.indexOf(word) >= 0; });
    }

private:
    std::vector<icu::UnicodeString> mWords;
};

struct Row {
    std::string key;
    std::size_t index;
};

void sortRows(std::vector<Row>& rows, bool byPlace) {
    std::stable_sort(rows.begin(), rows.end(), [byPlace](const Row& a, const Row& b) {
        return byPlace ? a.key < b.key : b.key < a.key;
    });
}

}  // namespace

bool asksForPart(const Call& call) {
    return call.query.count("limit") != 0;
}

ListPart partOf(const Call& call, const ListItems& items) {
    const auto limit = static_cast<std::size_t>(std::min(call.number("limit", kMaxLimit, 1), kMaxLimit));
    const auto offset = static_cast<std::size_t>(call.number("offset", 0, 0));
    const std::string order = call.param("order", "changed");
    if (order != "changed" && order != "place")
        throw ApiError{400, "invalidParameter", "Invalid value '" + order + "' for order", "order"};
    const bool byPlace = order == "place";
    const Words words(call.param("q"));
    ListPart part;
    std::vector<Row> rows;
    for (std::size_t i = 0; i < items.count; ++i) {
        if (!items.isThere(i)) continue;
        ++part.total;
        if (!words.isEmpty() && !words.areIn(items.text(i))) continue;
        rows.push_back({byPlace ? items.place(i) : items.etag(i), i});
    }
    part.matching = rows.size();
    sortRows(rows, byPlace);
    for (std::size_t i = offset; i < rows.size() && i - offset < limit; ++i)
        part.indexes.push_back(rows[i].index);
    return part;
}

Reply partReply(const ListPart& part, const std::function<Json(std::size_t)>& json) {
    Json body = {{"total", part.total}, {"matching", part.matching}, {"items", Json::array()}};
    for (const std::size_t index : part.indexes) body["items"].push_back(json(index));
    return jsonReply(body);
}

void requireMatch(const Call& call, const std::string& etag) {
    const std::string wanted = call.header("If-Match");
    if (!wanted.empty() && wanted != "*" && wanted != etag)
        throw ApiError{412, "conditionNotMet", "Precondition Failed", "If-Match"};
}

}  // namespace provider
