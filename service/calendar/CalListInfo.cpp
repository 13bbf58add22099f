#include "calendar/CalListInfo.h"

#include "common/JsonText.h"

std::string CalListInfo::jsonText() const {
    return json_text::textOf(json.get());
}
