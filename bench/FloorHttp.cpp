#include "FloorHttp.h"

#include <stdexcept>

namespace bench {

namespace {

std::size_t append(char* data, std::size_t size, std::size_t count, void* text) {
    static_cast<std::string*>(text)->append(data, size * count);
    return size * count;
}

CurlList headersWith(const std::string& token) {
    CurlList list;
    for (const std::string& header :
         {"Authorization: Bearer " + token, std::string("Content-Type: application/json"),
          std::string("XData-Version: 3.0"), std::string("Expect:")}) {
        curl_slist* longer = curl_slist_append(list.get(), header.c_str());
        if (longer == nullptr) throw std::bad_alloc();
        (void)list.release();
        list.reset(longer);
    }
    return list;
}

}  // namespace

std::string textOf(JsonObject* object, const char* member) {
    JsonNode* node = object != nullptr ? json_object_get_member(object, member) : nullptr;
    const bool isText =
        node != nullptr && JSON_NODE_HOLDS_VALUE(node) && json_node_get_value_type(node) == G_TYPE_STRING;
    return isText ? json_node_get_string(node) : "";
}

FloorHttp::FloorHttp(std::string base)
    : mBase(std::move(base)), mCurl(curl_easy_init()), mParser(json_parser_new()) {
    CURL* curl = mCurl.get();
    if (curl == nullptr) throw std::runtime_error("curl_easy_init() failed");
    curl_easy_setopt(curl, CURLOPT_ACCEPT_ENCODING, "gzip");
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYPEER, 0L);
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYHOST, 0L);
    curl_easy_setopt(curl, CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(curl, CURLOPT_FAILONERROR, 1L);
    curl_easy_setopt(curl, CURLOPT_WRITEFUNCTION, append);
    curl_easy_setopt(curl, CURLOPT_WRITEDATA, &mBody);
}

void FloorHttp::logIn() {
    curl_easy_setopt(mCurl.get(), CURLOPT_POSTFIELDS, "grant_type=refresh_token");
    const JsonNodePtr reply = perform("/o/oauth2/token");
    mHeaders = headersWith(textOf(json_node_get_object(reply.get()), "access_token"));
    curl_easy_setopt(mCurl.get(), CURLOPT_HTTPHEADER, mHeaders.get());
}

JsonNodePtr FloorHttp::get(const std::string& address) {
    curl_easy_setopt(mCurl.get(), CURLOPT_HTTPGET, 1L);
    return perform(address);
}

JsonNodePtr FloorHttp::post(const std::string& path, const std::string& body) {
    curl_easy_setopt(mCurl.get(), CURLOPT_POST, 1L);
    curl_easy_setopt(mCurl.get(), CURLOPT_POSTFIELDSIZE, static_cast<long>(body.size()));
    curl_easy_setopt(mCurl.get(), CURLOPT_POSTFIELDS, body.c_str());
    return perform(path);
}

JsonNodePtr FloorHttp::perform(const std::string& address) {
    const std::string url = address.starts_with('/') ? mBase + address : address;
    mBody.clear();
    ++mRequests;
    curl_easy_setopt(mCurl.get(), CURLOPT_URL, url.c_str());
    if (const CURLcode code = curl_easy_perform(mCurl.get()); code != CURLE_OK)
        throw std::runtime_error(url + ": " + curl_easy_strerror(code));
    GError* error = nullptr;
    if (json_parser_load_from_data(mParser.get(), mBody.data(), static_cast<gssize>(mBody.size()), &error) ==
        FALSE) {
        const GErrorPtr owned(error);
        throw std::runtime_error(url + ": " + owned->message);
    }
    return JsonNodePtr(json_parser_steal_root(mParser.get()));
}

}  // namespace bench
