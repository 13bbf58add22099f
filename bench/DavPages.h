// DavPages: the same number of items for a CalDAV and CardDAV client, as whole answers made once.
// Owner: the page server. Threads: made before the server runs, then read only.
#pragma once

#include <string>

#include "BulkContent.h"

namespace bench {

class DavPages {
public:
    explicit DavPages(const ItemCounts& counts);

    static bool isDav(const std::string& target) { return target.starts_with("/dav/"); }
    // The whole HTTP answer to a PROPFIND or REPORT below /dav/. A request for contents gets those of all items: the client asks for
    // none or for all of them.
    [[nodiscard]] const std::string& answer(const std::string& method, const std::string& target,
                                            const std::string& body) const;

private:
    struct Folder {
        std::string list;      // addresses and etags
        std::string contents;  // with the items themselves
        std::string self;      // of the folder alone
    };
    Folder mEvents;
    Folder mContacts;
    std::string mDone;  // of anything else
};

}  // namespace bench
