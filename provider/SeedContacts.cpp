#include <string_view>

#include "Base64.h"
#include "FeedNames.h"
#include "Seed.h"

namespace provider {

namespace {

// A rel or protocol that begins with "#" is one of the kind namespace.
constexpr std::string_view kFriends = R"json([
{"id":"ada","gd$name":{"gd$namePrefix":{"$t":"Dr."},"gd$givenName":{"$t":"Ada","yomi":"エイダ"},
  "gd$additionalName":{"$t":"Maria","yomi":"マリア"},"gd$familyName":{"$t":"Lindqvist","yomi":"リンドクヴィスト"},
  "gd$nameSuffix":{"$t":"Jr."}},
 "gContact$nickname":{"$t":"Addie"},"gContact$birthday":{"when":"1979-05-21"},
 "content":{"$t":"Met in Uppsala.\nLikes <tea> & \"cake\"."},
 "gd$email":[{"rel":"#home","address":"ada@provider.example","primary":"true"},
  {"rel":"#work","address":"ada.lindqvist@work.example"},{"rel":"#mobile","address":"ada@phone.example"},
  {"rel":"#other","address":"ada.other@provider.example"},{"label":"Club","address":"ada@club.example"}],
 "gd$phoneNumber":[{"rel":"#mobile","primary":"true","$t":"+46 70 555 01 01"},{"rel":"#home",
   "$t":"+46 18 555 01 02"}],
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/6","deleted":"false"},
  {"href":"/m8/feeds/groups/default/base/starred","deleted":"false"},
  {"href":"/m8/feeds/groups/default/base/family","deleted":"false"}]},
{"id":"phones","gd$name":{"gd$fullName":{"$t":"Benno Telefonmann"},"gd$givenName":{"$t":"Benno"},
  "gd$familyName":{"$t":"Telefonmann"}},
 "gd$phoneNumber":[{"rel":"#mobile","$t":"+49 170 5550100"},{"rel":"#home","$t":"+49 30 5550101"},
  {"rel":"#work","primary":"true","$t":"+49 30 5550102"},{"rel":"#work_fax","$t":"+49 30 5550103"},
  {"rel":"#home_fax","$t":"+49 30 5550104"},{"rel":"#pager","$t":"+49 30 5550105"},
  {"rel":"#assistant","$t":"+49 30 5550106"},{"rel":"#car","$t":"+49 30 5550107"},{"rel":"#fax",
   "$t":"+49 30 5550108"},
  {"rel":"#isdn","$t":"+49 30 5550109"},{"rel":"#other","$t":"+49 30 5550110"},{"rel":"#work_mobile",
   "$t":"+49 30 5550111"},
  {"rel":"#work_pager","$t":"+49 30 5550112"},{"rel":"#main","$t":"+49 30 5550113"},{"label":"Boat",
   "$t":"+49 30 5550114"}],
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/6"},
   {"href":"/m8/feeds/groups/default/base/colleagues"}]},
{"id":"chats","gd$name":{"gd$givenName":{"$t":"Chiara"},"gd$familyName":{"$t":"Messaggi"}},
 "gd$im":[{"rel":"#home","protocol":"#VANTOR_TALK","address":"chiara.talk"},{"rel":"#other",
   "protocol":"#MSN","address":"chiara.msn"},
  {"protocol":"#YAHOO","address":"chiara.y"},{"protocol":"#ICQ","address":"5550100"},
  {"protocol":"#AIM","address":"chiara.aim"},{"protocol":"#QQ","address":"5550101"},
  {"rel":"#work","protocol":"#JABBER","address":"chiara@chat.example"},{"protocol":"#SKYPE",
   "address":"chiara.s"},
  {"rel":"#other","address":"chiara.plain"},{"label":"IRC","address":"chiara_irc"},{"label":"Intranet",
   "address":"chiara.in"}],
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/6"}]},
{"id":"works","gd$name":{"gd$givenName":{"$t":"Dmitri"},"gd$familyName":{"$t":"Работник"}},
 "gd$organization":[{"rel":"#work","primary":"true","gd$orgName":{"$t":"Provider & Sons","yomi":"プロバイダー"},
   "gd$orgTitle":{"$t":"Engineer"},"gd$orgJobDescription":{"$t":"Builds bridges"},
   "gd$orgDepartment":{"$t":"Structures"},
   "gd$orgSymbol":{"$t":"P&S"},"gd$where":{"valueString":"Building 7"}},
  {"rel":"#other","gd$orgName":{"$t":"Chess club"}},{"label":"Volunteer","gd$orgName":{"$t":"Lifeboat"}}],
 "gContact$billingInformation":{"$t":"Invoice monthly"},"gContact$directoryServer":{"$t":"dir.example"},
 "gContact$occupation":{"$t":"Bridge engineer"},"gContact$subject":{"$t":"Bridges"},
   "gContact$mileage":{"$t":"1000"},
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/6"},
   {"href":"/m8/feeds/groups/default/base/colleagues"}]},
{"id":"homes","gd$name":{"gd$givenName":{"$t":"Élodie"},"gd$familyName":{"$t":"Maison"}},
 "gd$structuredPostalAddress":[{"rel":"#home","primary":"true","gd$street":{"$t":"12 rue Longue"},
   "gd$pobox":{"$t":"BP 7"},
   "gd$neighborhood":{"$t":"Vieux Port"},"gd$city":{"$t":"Marseille"},"gd$region":{"$t":"Provence"},
   "gd$postcode":{"$t":"13002"},"gd$country":{"$t":"France"},
   "gd$formattedAddress":{"$t":"12 rue Longue\n13002 Marseille"}},
  {"rel":"#work","gd$street":{"$t":"1 place du Bureau"},"gd$city":{"$t":"Aix"}},
  {"rel":"#other","gd$city":{"$t":"Nice"}},{"label":"Chalet","gd$street":{"$t":"Le Haut"},
   "gd$country":{"$t":"Suisse"}}],
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/family"}]}
])json";

constexpr std::string_view kOthers = R"json([
{"id":"kin","gd$name":{"gd$givenName":{"$t":"Femi"},"gd$familyName":{"$t":"Adeyemi"}},
 "gContact$relation":[{"rel":"assistant","$t":"Ayo"},{"rel":"brother","$t":"Bode"},{"rel":"child",
   "$t":"Chidi"},
  {"rel":"domestic-partner","$t":"Dayo"},{"rel":"father","$t":"Ebo"},{"rel":"friend","$t":"Folu"},
  {"rel":"manager","$t":"Gbenga"},{"rel":"mother","$t":"Habiba"},{"rel":"parent","$t":"Ike"},
   {"rel":"partner","$t":"Jide"},
  {"rel":"referred-by","$t":"Kemi"},{"rel":"relative","$t":"Lola"},{"rel":"sister","$t":"Musa"},
   {"rel":"spouse","$t":"Nneka"},
  {"label":"Godchild","$t":"Obi"}],
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/6"},
   {"href":"/m8/feeds/groups/default/base/family"}]},
{"id":"dates","gd$name":{"gd$givenName":{"$t":"Greta"},"gd$familyName":{"$t":"Kalender"}},
   "gContact$birthday":{"when":"--02-29"},
 "gContact$event":[{"rel":"anniversary","gd$when":{"startTime":"2004-06-12"}},
  {"rel":"other","gd$when":{"startTime":"2011-09-01"}},{"label":"Name day",
   "gd$when":{"startTime":"2026-03-17"}}],
 "gContact$calendarLink":[{"rel":"home","href":"http://calendar.example/greta"}],
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/6"},
   {"href":"/m8/feeds/groups/default/base/starred"}]},
{"id":"sites","gd$name":{"gd$givenName":{"$t":"Hiro"},"gd$familyName":{"$t":"佐藤"}},
 "gContact$website":[{"href":"{base}/profiles/p100","rel":"profile"},{"href":"http://hiro.example/",
   "rel":"home"},
  {"href":"http://work.example/hiro?a=1&b=2","rel":"work"},{"href":"http://other.example/","rel":"other"},
  {"href":"http://page.example/","rel":"home-page"},{"href":"http://blog.example/","rel":"blog"},
  {"href":"http://shop.example/","label":"Shop"}],
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/6"}]},
{"id":"fields","gd$name":{"gd$givenName":{"$t":"Ines"},"gd$familyName":{"$t":"Campos"}},
 "gContact$userDefinedField":[{"key":"Shoe size","value":"39"},{"key":"Locker","value":"B <12>"},
   {"key":"Empty","value":""}],
 "gContact$externalId":[{"rel":"customer","value":"4711"},{"label":"Card","value":"0815"}],
 "gContact$jot":[{"rel":"home","$t":"Rings twice"}],"gContact$hobby":[{"$t":"Rowing"},{"$t":"Fado"}],
 "gContact$language":[{"code":"pt"},{"label":"Mirandese"}],"gContact$gender":{"value":"female"},
 "gContact$initials":{"$t":"IC"},"gContact$maidenName":{"$t":"Sousa"},"gContact$priority":{"rel":"high"},
 "gContact$sensitivity":{"rel":"private"},"gContact$shortName":{"$t":"Ines"},
 "gd$extendedProperty":[{"name":"source","value":"card reader"}]},
{"id":"title","title":{"$t":"Only a title"}},
{"id":"mail","gd$email":[{"rel":"#other","address":"nobody@provider.example"}]},
{"id":"long","gd$name":{"gd$givenName":{"$t":"김"},"gd$familyName":{"$t":"민준"}},
 "gContact$nickname":{"$t":"🎻 MJ"},"gContact$birthday":{"when":"1990-12-31"},
 "gd$phoneNumber":[{"rel":"#mobile","$t":"+82 10 5550 0100"}],
 "gContact$groupMembershipInfo":[{"href":"/m8/feeds/groups/default/base/6"},
   {"href":"/m8/feeds/groups/default/base/starred"}]}
])json";

struct SamplePhoto {
    const char* contact;
    const char* bytes;
};
// Squares of eight pixels, each of one colour.
constexpr SamplePhoto kPhotos[] = {
    {"ada",
     "iVBORw0KGgoAAAANSUhEUgAAAAgAAAAICAIAAABLbSncAAAAEUlEQVR42mM4oaGBFTEMLQkAgl1GARdiiXUAAAAASUVORK5CYII="},
    {"works",
     "iVBORw0KGgoAAAANSUhEUgAAAAgAAAAICAIAAABLbSncAAAAEUlEQVR42mPQWGCDFTEMLQkAYT9BAeUr7hIAAAAASUVORK5CYII="},
    {"long",
     "iVBORw0KGgoAAAANSUhEUgAAAAgAAAAICAIAAABLbSncAAAAEUlEQVR42mPQCDiBFTEMLQkAGplQAbyoaQ8AAAAASUVORK5CYII="},
};
constexpr const char* kProfilePhoto =
    "iVBORw0KGgoAAAANSUhEUgAAAAgAAAAICAIAAABLbSncAAAAEUlEQVR42mN4tkUEK2IYWhIANb5rgbHTUk0AAAAASUVORK5CYII=";
constexpr std::string_view kProfile =
    R"json({"name":{"givenName":"Hiroshi","familyName":"佐藤"},"nickname":"Hiro","birthday":"1985-07-07"})json";

void expandWords(Json& value) {
    for (const char* word : {"rel", "protocol"}) {
        if (!value.is_object() || !value.contains(word)) continue;
        const std::string text = value[word].get<std::string>();
        if (text.starts_with('#')) value[word] = kKindNamespace + text;
    }
    if (!value.is_structured()) return;
    for (Json& item : value) expandWords(item);
}

void addContacts(ContactBook& book, std::string_view contacts) {
    Json items = Json::parse(contacts);
    expandWords(items);
    for (const Json& item : items) book.insert(FeedKind::kContact, item, item.at("id"));
}

}  // namespace

void seedContacts(Store& store, const std::string& email) {
    ContactBook& book = store.contacts(email);
    book.insert(FeedKind::kGroup, {{"title", {{"$t", "Family"}}}, {"content", {{"$t", "Kith & kin"}}}},
                "family");
    book.insert(FeedKind::kGroup, {{"title", {{"$t", "Colleagues"}}}}, "colleagues");
    addContacts(book, kFriends);
    addContacts(book, kOthers);
    for (const SamplePhoto& row : kPhotos) {
        book.setPhoto(row.contact, fromBase64(row.bytes).value_or(""), "image/png");
    }
    store.putPerson("p100", Json::parse(kProfile));
    store.setPersonPhoto("p100", fromBase64(kProfilePhoto).value_or(""), "image/png");
}

}  // namespace provider
