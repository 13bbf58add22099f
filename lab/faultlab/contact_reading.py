"""Contacts of either side, brought to one form that can be compared: an independent reading of the wire."""
import hashlib
import json

PHONE_TYPES = {"mobile", "home", "work", "work_fax", "home_fax", "pager", "assistant", "car", "fax", "isdn", "other",
               "work_mobile", "work_pager"}
PROTOCOLS = {"VANTOR_TALK", "MSN", "YAHOO", "ICQ", "AIM", "QQ", "JABBER", "SKYPE"}
RELATIONS = {"assistant", "brother", "child", "domestic-partner", "father", "friend", "manager", "mother", "parent",
             "partner", "referred-by", "relative", "sister", "spouse"}
NAME_PARTS = {"first": "gd$givenName", "middle": "gd$additionalName", "last": "gd$familyName", "prefix": "gd$namePrefix",
              "suffix": "gd$nameSuffix"}
PHONETIC_PARTS = {"phoneticFirst": "gd$givenName", "phoneticMiddle": "gd$additionalName",
                  "phoneticLast": "gd$familyName"}


def _text(element, member, inner="$t"):
    return element.get(member, {}).get(inner, "")


def _typed(item, element, words, member="type", attribute="rel"):
    word = element.get(attribute, "").rpartition("#")[2]
    label = "" if attribute in element else element.get("label", "")
    kind = word if word in words else "other"
    return {**item, member: "custom" if label else kind, "label": label}


def _date(text):
    return "" if text.startswith("--") else text


def _events(entry):
    events = [_typed({"date": _date(_text(e, "gd$when", "startTime"))}, e, {"anniversary"})
              for e in entry.get("gContact$event", [])]
    if "gContact$birthday" in entry:
        events.append({"date": _date(_text(entry, "gContact$birthday", "when")), "type": "birthday", "label": ""})
    return events


def _company(element):
    return _typed({"name": _text(element, "gd$orgName"), "title": _text(element, "gd$orgTitle"),
                   "department": _text(element, "gd$orgDepartment"),
                   "description": _text(element, "gd$orgJobDescription"),
                   "location": _text(element, "gd$where", "valueString"), "symbol": _text(element, "gd$orgSymbol")},
                  element, {"work"})


def _address(element):
    return _typed({"street": _text(element, "gd$street"), "pobox": _text(element, "gd$pobox"),
                   "extended": _text(element, "gd$neighborhood"), "city": _text(element, "gd$city"),
                   "region": _text(element, "gd$region"), "postcode": _text(element, "gd$postcode"),
                   "country": _text(element, "gd$country"), "primary": element.get("primary") == "true"},
                  element, {"home", "work"})


# member of the tool's JSON: (member of the wire, how an element is read)
LISTS = {
    "emails": ("gd$email", lambda e: _typed({"value": e.get("address", "")}, e, {"home", "work", "mobile"})),
    "phones": ("gd$phoneNumber", lambda e: _typed(
        {"value": e.get("$t", ""), "primary": e.get("primary") == "true"}, e, PHONE_TYPES)),
    "addresses": ("gd$structuredPostalAddress", _address),
    "companies": ("gd$organization", _company),
    "messengers": ("gd$im", lambda e: _typed({"value": e.get("address", "")}, e, PROTOCOLS, "protocol", "protocol")),
    "relations": ("gContact$relation", lambda e: _typed({"name": e.get("$t", "")}, e, RELATIONS)),
    "urls": ("gContact$website", lambda e: _typed({"value": e.get("href", "")}, e, {"home", "work", "other"})),
    "fields": ("gContact$userDefinedField", lambda e: {"key": e.get("key", ""), "value": e.get("value", "")}),
}


def _canonical(contact):
    """The order of elements is no part of what a contact says."""
    ordered = {member: sorted(value, key=lambda v: json.dumps(v, sort_keys=True)) if isinstance(value, list) else value
               for member, value in contact.items()}
    return json.dumps(ordered, sort_keys=True, ensure_ascii=False)


def _digest(photo):
    return hashlib.sha256(photo).hexdigest()[:16] if photo else ""


def wire_contact(entry, group_names, photo):
    name = entry.get("gd$name", {})
    contact = {"name": {**{part: _text(name, member) for part, member in NAME_PARTS.items()},
                        **{part: _text(name, member, "yomi") for part, member in PHONETIC_PARTS.items()}},
               "nickname": _text(entry, "gContact$nickname"), "note": _text(entry, "content"),
               "events": _events(entry), "photo": _digest(photo),
               "groups": sorted({group_names[m["href"].rpartition("/")[2]]
                                 for m in entry.get("gContact$groupMembershipInfo", [])})}
    for member, (wire, read) in LISTS.items():
        contact[member] = [read(element) for element in entry.get(wire, [])]
    return _canonical(contact)


def device_contact(listed, group_names, photo):
    contact = {member: value for member, value in listed.items() if member not in ("id", "account")}
    contact["groups"] = [group_names.get(group, f"no group {group}") for group in listed["groups"]]
    contact["photo"] = _digest(photo)
    return _canonical(contact)
