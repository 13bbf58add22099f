// PageReader: follows the page tokens of a list to its end.
#pragma once

#include <string>
#include <unordered_set>

#include "common/SyncLog.h"
#include "common/SyncResult.h"

// `fetch(token, &page)` reads one page, `use(page)` takes it; both return SyncResult.h codes and anything but 0 ends the
// reading with that code. A token that repeats would never end: it is an error, and the list was not read to its end.
// `isStopped()` is asked before each request; a stop ends with kStopped.
template <class Page, class Fetch, class Use, class IsStopped>
[[nodiscard]] int readPages(Fetch fetch, Use use, IsStopped isStopped) {
    std::unordered_set<std::string> tokens;
    std::string token;
    do {
        if (isStopped()) return sync_result::kStopped;
        Page page;
        if (const int result = fetch(token, &page); result != sync_result::kOk) return result;
        token = page.nextPageToken;
        if (!token.empty() && !tokens.insert(token).second) {
            SYNC_ERR("the server repeats the page token(%s)", token.c_str());
            return sync_result::kFailed;
        }
        if (const int result = use(page); result != sync_result::kOk) return result;
    } while (!token.empty());
    return sync_result::kOk;
}
