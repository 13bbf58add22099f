// The readers of the contacts service's replies. Stateless.   Threads: any.
// Errors: 0 or -1, each failure logged with its own text; outputs untouched on failure.
#pragma once

#include <string>

#include "contacts/CtEntryInfo.h"

class CtContactListJsonParser {
public:
    [[nodiscard]] static int parse(const std::string& text, CtContactPage* page);
};

class CtGroupListJsonParser {
public:
    [[nodiscard]] static int parse(const std::string& text, CtGroupPage* page);
};

// The entry that the server answers a write with.
struct CtEntryMetaData {
    std::string id;  // the base id
    std::string etag;
    std::string updated;
    std::string editId;
    std::string photoHref;
    std::string photoEtag;
    JsonNodePtr entry;
};

class CtEntryMetaDataParser {
public:
    [[nodiscard]] static int getMetaData(const std::string& text, CtEntryMetaData* out);
};

class CtAccessTokenParser {
public:
    // Of the token endpoint's reply. Nothing of it is logged.
    [[nodiscard]] static int getAccessToken(const std::string& text, std::string* token);
};
