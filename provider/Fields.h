// Fields: the parameter that asks for a part of a reply, as in "items(etag,id,start/date),nextPageToken".
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Http.h"

namespace provider {

class Fields {
public:
    // Everything.
    Fields() = default;
    // Throws ApiError 400 for text that is not a selection; empty text selects everything.
    static Fields parse(std::string_view text);

    [[nodiscard]] bool all() const { return mChildren.empty(); }
    // What is selected below a member; nullptr when the member is not selected.
    [[nodiscard]] const Fields* below(std::string_view member) const;
    // Throws ApiError 400 when a name other than these (or "*") is selected at the top.
    void allowOnly(std::initializer_list<std::string_view> known) const;
    // The selected part; an array is taken element by element.
    [[nodiscard]] Json apply(const Json& value) const;

private:
    friend class FieldsParser;
    std::vector<std::pair<std::string, Fields>> mChildren;  // none: everything
};

}  // namespace provider
