#include "FeedJson.h"

#include <cctype>

#include "ContactBook.h"
#include "FeedNames.h"

namespace provider {

namespace {

Json text(const std::string& value) {
    return {{"$t", value}};
}

Json category(FeedKind kind) {
    const char* term = kind == FeedKind::kContact ? kContactTerm : kGroupTerm;
    return Json::array({{{"scheme", kKindScheme}, {"term", term}}});
}

Json links(FeedKind kind, const FeedEntry& entry, const FeedPlace& place) {
    Json list = Json::array();
    if (kind == FeedKind::kContact) {
        const std::string href = place.origin + kFeeds + "photos/media/" + encodeSegment(place.email) + "/" +
                                 encodeSegment(entry.id);
        list.push_back({{"rel", kPhotoRel}, {"type", "image/*"}, {"href", href}});
        if (entry.photo.isThere()) list.back()["gd$etag"] = entry.photo.etag;
    }
    for (const char* rel : {"self", "edit"}) {
        list.push_back({{"rel", rel},
                        {"type", "application/atom+xml"},
                        {"href", place.origin + feedPath(kind, place.email, "full", entry.id)}});
    }
    return list;
}

}  // namespace

std::string encodeSegment(std::string_view text) {
    constexpr std::string_view kDigits = "0123456789ABCDEF";
    std::string out;
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (byte < 0x80 &&
            (std::isalnum(byte) != 0 || std::string_view("-._~").find(c) != std::string::npos)) {
            out += c;
        } else {
            out += '%';
            out += kDigits[byte >> 4U];
            out += kDigits[byte & 15U];
        }
    }
    return out;
}

std::string feedPath(FeedKind kind, const std::string& email, const std::string& view,
                     const std::string& id) {
    std::string path = kFeeds;
    path += kind == FeedKind::kContact ? "contacts/" : "groups/";
    path += encodeSegment(email) + "/" + view;
    return id.empty() ? path : path + "/" + encodeSegment(id);
}

Json shown(const Json& fields, const std::string& origin) {
    if (fields.is_string()) {
        std::string value = fields.get<std::string>();
        constexpr std::string_view kPlace = kBasePlace;
        if (value.starts_with(kPlace)) value.replace(0, kPlace.size(), origin);
        return value;
    }
    if (!fields.is_structured()) return fields;
    Json out = fields;
    for (Json& item : out) item = shown(item, origin);
    return out;
}

Json entryJson(FeedKind kind, const FeedEntry& entry, const FeedPlace& place) {
    Json out = {{"id", text(place.origin + feedPath(kind, place.email, "base", entry.id))},
                {"gd$etag", entry.etag},
                {"updated", text(entry.updated)},
                {"category", category(kind)},
                {"title", entry.fields.at("title")},
                {"link", links(kind, entry, place)}};
    if (entry.isDeleted) {
        out["gd$deleted"] = Json::object();
        out["deleted"] = Json::object();
        return out;
    }
    for (const auto& [name, value] : entry.fields.items()) out[name] = shown(value, place.origin);
    return out;
}

Json document(const char* name, Json content) {
    Json out = {{"version", "1.0"}, {"encoding", "UTF-8"}};
    out[name] = std::move(content);
    return out;
}

Json feedHead(FeedKind kind, const FeedPlace& place) {
    return {{"xmlns", kAtomNamespace},
            {"xmlns$gd", kKindNamespace},
            {"xmlns$gContact", kContactNamespace},
            {"id", text(place.email)},
            {"category", category(kind)},
            {"link", Json::array({{{"rel", "self"},
                                   {"type", "application/atom+xml"},
                                   {"href", place.origin + feedPath(kind, place.email, "full")}}})}};
}

}  // namespace provider
