// EventText: an event as it goes over the wire, with the places of its members, so that a page is put together,
// whole or in part, without parsing anything again.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "Fields.h"

namespace provider {

class EventText {
public:
    EventText() = default;
    explicit EventText(const Json& event);

    [[nodiscard]] const std::string& text() const { return mText; }
    [[nodiscard]] Json json() const { return Json::parse(mText); }
    // The value of one member; null when there is none.
    [[nodiscard]] Json member(std::string_view name) const;
    // Appends the selected part.
    void append(std::string& out, const Fields& fields) const;

private:
    struct Member {
        std::uint32_t name;  // of the quoted name
        std::uint32_t value;
        std::uint32_t end;
    };
    std::string mText;
    std::vector<Member> mMembers;
};

}  // namespace provider
