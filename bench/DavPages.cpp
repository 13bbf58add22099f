#include "DavPages.h"

#include "PageSource.h"

namespace bench {

namespace {

constexpr const char* kXml = "application/xml; charset=utf-8";
constexpr const char* kBegin =
    R"(<?xml version="1.0" encoding="utf-8"?><d:multistatus xmlns:d="DAV:" )"
    R"(xmlns:c="urn:ietf:params:xml:ns:caldav" xmlns:a="urn:ietf:params:xml:ns:carddav">)";
constexpr const char* kEnd = "</d:multistatus>";
constexpr std::size_t kEventBytes = 1500;
constexpr std::size_t kCardBytes = 1000;

// What an item of a folder looks like.
struct Form {
    const char* folder;
    const char* suffix;
    const char* type;
    const char* element;  // that holds the item
    std::string (*text)(std::size_t);
};

std::string padded(const std::string& text, const char* name, std::size_t seed, std::size_t bytes,
                   const char* end) {
    const std::size_t used = text.size() + std::string_view(end).size() + std::string_view(name).size() + 3;
    return text + name + ":" + filler(seed, used < bytes ? bytes - used : 0) + "\r\n" + end;
}

std::string eventText(std::size_t i) {
    const std::string number = std::to_string(i);
    std::string day = std::to_string(i % 28 + 1);
    if (day.size() < 2) day.insert(0, "0");
    std::string text = "BEGIN:VCALENDAR\r\nVERSION:2.0\r\nPRODID:-//bench//EN\r\nBEGIN:VEVENT\r\nUID:event" +
                       number + "@provider.example\r\nDTSTAMP:20260101T000000Z\r\nDTSTART:202601" + day +
                       "T080000Z\r\nDTEND:202601" + day + "T083000Z\r\nSUMMARY:Event " + number +
                       "\r\nLOCATION:Room " + std::to_string(i % 40) + "\r\n";
    if (i % 10 == 0) text += "RRULE:FREQ=WEEKLY;COUNT=10\r\n";
    for (const char* name : {"Ada", "Benno"}) {
        text += std::string("ATTENDEE;CN=") + name + ";PARTSTAT=ACCEPTED:mailto:" + name +
                std::to_string(i % 50) + "@provider.example\r\n";
    }
    return padded(text, "DESCRIPTION", i, kEventBytes, "END:VEVENT\r\nEND:VCALENDAR\r\n");
}

std::string cardText(std::size_t i) {
    const std::string number = std::to_string(i);
    const std::string text = "BEGIN:VCARD\r\nVERSION:3.0\r\nUID:contact" + number +
                             "@provider.example\r\nFN:Person Number " + number + "\r\nN:Number " + number +
                             ";Person;;;\r\nEMAIL;TYPE=HOME:p" + number +
                             "@provider.example\r\nTEL;TYPE=CELL:+1 555 " + number + "\r\n";
    return padded(text, "NOTE", i, kCardBytes, "END:VCARD\r\n");
}

constexpr Form kEventForm{"/dav/events/", ".ics", "text/calendar", "c:calendar-data", eventText};
constexpr Form kCardForm{"/dav/contacts/", ".vcf", "text/vcard", "a:address-data", cardText};

std::string response(const std::string& href, const std::string& properties) {
    return "<d:response><d:href>" + href + "</d:href><d:propstat><d:prop>" + properties +
           "</d:prop><d:status>HTTP/1.1 200 OK</d:status></d:propstat></d:response>";
}

std::string multistatus(const std::string& responses) {
    return makeReply(207, kXml, kBegin + responses + kEnd);
}

}  // namespace

DavPages::DavPages(const ItemCounts& counts) : mDone(makeReply(200, kXml, "")) {
    const auto make = [](const Form& form, std::size_t count, Folder* folder) {
        const std::string self = response(
            form.folder, "<d:resourcetype><d:collection/></d:resourcetype><d:getetag>\"0\"</d:getetag>");
        std::string list = self;
        std::string contents;
        for (std::size_t i = 0; i < count; ++i) {
            const std::string number = std::to_string(i);
            const std::string href = form.folder + number + form.suffix;
            const std::string common = "<d:resourcetype/><d:getcontenttype>" + std::string(form.type) +
                                       "</d:getcontenttype><d:getetag>\"" + number + "\"</d:getetag>";
            list += response(href, common);
            contents +=
                response(href, common + "<" + form.element + ">" + form.text(i) + "</" + form.element + ">");
        }
        folder->list = multistatus(list);
        folder->contents = multistatus(contents);
        folder->self = multistatus(self);
    };
    make(kEventForm, counts.events, &mEvents);
    make(kCardForm, counts.contacts, &mContacts);
}

const std::string& DavPages::answer(const std::string& method, const std::string& target,
                                    const std::string& body) const {
    const Folder& folder = target.starts_with(kEventForm.folder) ? mEvents : mContacts;
    if (method == "PROPFIND") return body.find("getetag") != std::string::npos ? folder.list : folder.self;
    if (method != "REPORT") return mDone;
    return body.find("-multiget") != std::string::npos ? folder.contents : folder.list;
}

}  // namespace bench
