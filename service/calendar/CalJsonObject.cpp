#include "calendar/CalJsonObject.h"

#include <memory>

#include "common/JsonText.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

struct FreeText {
    void operator()(char* text) const noexcept { g_free(text); }
};
using Text = std::unique_ptr<char, FreeText>;

Text validUtf8(const std::string& text) {
    return Text(g_utf8_make_valid(text.data(), static_cast<gssize>(text.size())));
}

struct UnrefArray {
    void operator()(JsonArray* array) const noexcept { json_array_unref(array); }
};
using Array = std::unique_ptr<JsonArray, UnrefArray>;

}  // namespace

int CalJsonObject::initialize() {
    mpNode.reset(json_node_new(JSON_NODE_OBJECT));
    if (!mpNode) {
        SYNC_ERR("json_node_new fail");
        return kFailed;
    }
    JsonObject* object = json_object_new();
    if (object == nullptr) {
        SYNC_ERR("json_object_new fail");
        return kFailed;
    }
    json_node_take_object(mpNode.get(), object);
    return kOk;
}

void CalJsonObject::addStringMember(const char* name, const std::string& text) {
    json_object_set_string_member(object(), name, validUtf8(text).get());
}

void CalJsonObject::addIntegerMember(const char* name, int64_t value) {
    json_object_set_int_member(object(), name, value);
}

void CalJsonObject::addBooleanMember(const char* name, bool value) {
    json_object_set_boolean_member(object(), name, value ? TRUE : FALSE);
}

void CalJsonObject::addNullMember(const char* name) {
    json_object_set_null_member(object(), name);
}

void CalJsonObject::addObjectMember(const char* name, const CalJsonObject& object) {
    json_object_set_member(this->object(), name, json_node_copy(object.mpNode.get()));
}

void CalJsonObject::addArrayMember(const char* name, const std::vector<std::string>& texts) {
    Array array(json_array_sized_new(static_cast<guint>(texts.size())));
    for (const std::string& text : texts) json_array_add_string_element(array.get(), validUtf8(text).get());
    json_object_set_array_member(object(), name, array.release());
}

void CalJsonObject::addArrayMember(const char* name, const std::vector<CalJsonObject>& objects) {
    Array array(json_array_sized_new(static_cast<guint>(objects.size())));
    for (const CalJsonObject& element : objects)
        json_array_add_element(array.get(), json_node_copy(element.mpNode.get()));
    json_object_set_array_member(object(), name, array.release());
}

void CalJsonObject::removeMember(const char* name) {
    json_object_remove_member(object(), name);
}

bool CalJsonObject::hasMember(const char* name) const {
    return json_object_has_member(object(), name) != FALSE;
}

std::string CalJsonObject::getJsonString() const {
    return json_text::textOf(mpNode.get());
}
