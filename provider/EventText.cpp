#include "EventText.h"

#include <string_view>

namespace provider {

namespace {

std::string dump(const Json& value) {
    return value.dump(-1, ' ', false, Json::error_handler_t::replace);
}

}  // namespace

EventText::EventText(const Json& event) {
    mText.push_back('{');
    for (const auto& [name, value] : event.items()) {
        if (mText.size() > 1) mText += ',';
        Member member{};
        member.name = static_cast<std::uint32_t>(mText.size());
        mText += dump(name);
        mText.push_back(':');
        member.value = static_cast<std::uint32_t>(mText.size());
        mText += dump(value);
        member.end = static_cast<std::uint32_t>(mText.size());
        mMembers.push_back(member);
    }
    mText += '}';
    mText.shrink_to_fit();
    mMembers.shrink_to_fit();
}

Json EventText::member(std::string_view name) const {
    const std::string_view text = mText;
    for (const Member& member : mMembers) {
        if (text.substr(member.name + 1, member.value - member.name - 3) == name)
            return Json::parse(text.substr(member.value, member.end - member.value));
    }
    return nullptr;
}

void EventText::append(std::string& out, const Fields& fields) const {
    if (fields.all()) {
        out += mText;
        return;
    }
    const std::string_view text = mText;
    out += '{';
    bool first = true;
    for (const Member& member : mMembers) {
        const Fields* below = fields.below(text.substr(member.name + 1, member.value - member.name - 3));
        if (below == nullptr) continue;
        if (!first) out += ',';
        first = false;
        out += text.substr(member.name, member.value - member.name);
        const std::string_view value = text.substr(member.value, member.end - member.value);
        if (below->all()) {
            out += value;
        } else {
            out += dump(below->apply(Json::parse(value)));
        }
    }
    out += '}';
}

}  // namespace provider
