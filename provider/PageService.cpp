#include "PageFiles.h"
#include "Services.h"

namespace provider {

namespace {

struct MediaType {
    std::string_view ending;
    const char* type;
};
constexpr MediaType kMediaTypes[] = {{".html", "text/html; charset=utf-8"},
                                     {".css", "text/css; charset=utf-8"},
                                     {".js", "text/javascript; charset=utf-8"},
                                     {".svg", "image/svg+xml"}};

// "blob:" is for the preview of a photo that was chosen and not sent yet.
constexpr const char* kPolicy =
    "default-src 'none'; script-src 'self'; style-src 'self'; img-src 'self' blob:; connect-src 'self'; "
    "base-uri 'none'; form-action 'none'; frame-ancestors 'none'";

Reply fileReply(std::string_view name) {
    for (const PageFile& file : kPageFiles) {
        if (file.name != name) continue;
        Reply reply;
        reply.body = file.content;
        for (const MediaType& row : kMediaTypes) {
            if (name.ends_with(row.ending)) reply.contentType = row.type;
        }
        reply.headers["Content-Security-Policy"] = kPolicy;
        return reply;
    }
    throw ApiError{404, "notFound", "Not Found", ""};
}

}  // namespace

void PageService::addRoutes(Router& router) {
    router.add("GET", "/", Access::kAdmin, [](const Call&) { return fileReply("index.html"); });
    router.add("GET", "/page/*", Access::kAdmin, [](const Call& call) { return fileReply(call.ids[0]); });
}

}  // namespace provider
