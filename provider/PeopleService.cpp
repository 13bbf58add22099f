#include "Base64.h"
#include "Services.h"

namespace provider {

namespace {

// One grey pixel.
constexpr const char* kDefaultImage =
    "iVBORw0KGgoAAAANSUhEUgAAAAEAAAABCAAAAAA6fptVAAAACklEQVR42mNoAAAAggCB2kUIOwAAAABJRU5ErkJggg==";

Reply imageReply(const Image& image) {
    Reply reply;
    reply.contentType = image.isThere() ? image.type : "image/png";
    reply.body = image.isThere() ? image.bytes : fromBase64(kDefaultImage).value_or("");
    return reply;
}

}  // namespace

void PeopleService::addRoutes(Router& router) {
    router.add("GET", "/orbit/v1/people/*", Access::kOpen,
               [this](const Call& call) { return profile(call); });
    router.add("GET", "/img/*", Access::kOpen, [this](const Call& call) { return image(call); });
}

Reply PeopleService::profile(const Call& call) {
    call.allowOnly({});
    if (call.param("key").empty()) throw ApiError{400, "required", "Required parameter: key", "key"};
    const auto lock = mContext.store.guard();
    const Person& person = mContext.store.person(call.ids[0]);
    Json body = {{"id", call.ids[0]}};
    for (const auto& [name, value] : person.profile.items()) {
        if (name != "id") body[name] = value;
    }
    const std::string image = person.photo.isThere() ? call.ids[0] : "default";
    body["image"] = {{"url", call.origin + "/img/" + image}, {"isDefault", !person.photo.isThere()}};
    return jsonReply(body);
}

// There is one size of each image, whatever is asked for.
Reply PeopleService::image(const Call& call) {
    call.allowOnly({"sz"});
    (void)call.number("sz", 1, 1);
    const auto lock = mContext.store.guard();
    return imageReply(call.ids[0] == "default" ? Image{} : mContext.store.person(call.ids[0]).photo);
}

}  // namespace provider
