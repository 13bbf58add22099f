// Handles.h: owners for the C handles that the daemon uses. A raw handle never crosses a return or an early exit.
#pragma once

#include <curl/curl.h>
#include <glib-object.h>
#include <json-glib/json-glib.h>
#include <sqlite3.h>
#include <unicode/ucal.h>

#include <cstdlib>
#include <memory>

template <auto Fn>
struct FreeWith {
    template <class T>
    void operator()(T* pointer) const noexcept {
        Fn(pointer);
    }
};

using CurlEasy = std::unique_ptr<CURL, FreeWith<curl_easy_cleanup>>;
using CurlList = std::unique_ptr<curl_slist, FreeWith<curl_slist_free_all>>;
using CurlShare = std::unique_ptr<CURLSH, FreeWith<curl_share_cleanup>>;
using SqliteStmt = std::unique_ptr<sqlite3_stmt, FreeWith<sqlite3_finalize>>;
using IcuCalendar = std::unique_ptr<UCalendar, FreeWith<ucal_close>>;
using JsonParserPtr = std::unique_ptr<JsonParser, FreeWith<g_object_unref>>;
using JsonGeneratorPtr = std::unique_ptr<JsonGenerator, FreeWith<g_object_unref>>;
using JsonNodePtr = std::unique_ptr<JsonNode, FreeWith<json_node_unref>>;
using JsonObjectPtr = std::unique_ptr<JsonObject, FreeWith<json_object_unref>>;
using GErrorPtr = std::unique_ptr<GError, FreeWith<g_error_free>>;
using GChars = std::unique_ptr<char, FreeWith<g_free>>;
using CChars = std::unique_ptr<char, FreeWith<std::free>>;
