#include "contacts/CtIdUtil.h"

#include <string_view>

#include "common/SyncLog.h"
#include "common/UrlText.h"

namespace CtIdUtil {

namespace {

std::string idAfter(const std::string& href, std::string_view delimiter) {
    if (const size_t at = href.rfind(delimiter); at != std::string::npos)
        return href.substr(at + delimiter.size());
    const size_t slash = href.rfind('/');
    return slash == std::string::npos ? href : href.substr(slash + 1);
}

}  // namespace

std::string idAfterBase(const std::string& href) {
    return idAfter(href, ".com/base/");
}

std::string idAfterFull(const std::string& href) {
    return idAfter(href, ".com/full/");
}

std::string idAfterCom(const std::string& href) {
    return idAfter(href, ".com/");
}

std::string makeEditHref(const std::string& feedBase, CtItemType type, const std::string& id) {
    if (type == CtItemType::kPhoto) {
        SYNC_ERR("DO NOT USE THIS FUNCTION with photo type!");
        return {};
    }
    const char* feed = type == CtItemType::kContact ? "/contacts/" : "/groups/";
    return feedBase + feed + "default" + "/full/" + url_text::hrefSegment(id);
}

// Nobody asks for this address: the server and the listing look for the id at its end, letter by letter as the group's own href has it.
std::string makeGroupBaseHref(const std::string& feedBase, const std::string& groupId) {
    return feedBase + "/groups/" + "default" + "/base/" + groupId;
}

bool isFileName(const std::string& id) {
    constexpr size_t kMaxBytes = 200;
    return !id.empty() && id.size() <= kMaxBytes && id[0] != '.' && id.find('/') == std::string::npos &&
           id.find('\0') == std::string::npos;
}

}  // namespace CtIdUtil
