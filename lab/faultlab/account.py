"""The small account of the laboratory, and a change of each kind on either side. Every text is unlike any other."""
import json

from faultlab.provider import events_path, people_path, tasks_path

EMAIL = "small@lab.example"
LIST = "list-1"
KIND = "http://schemas.provider.example/g/2005#"
PNG = b"\x89PNG\r\n\x1a\n"

SEED = {"calendars": [{"id": EMAIL, "summary": "Personal"}],
        "accounts": [{"email": EMAIL, "calendars": [{"id": EMAIL, "accessRole": "owner"}],
                      "taskLists": [{"id": LIST, "title": "Home"}]}]}


def _times(day, hour=9):
    return {"start": {"dateTime": f"2026-03-{day:02}T{hour:02}:00:00Z"},
            "end": {"dateTime": f"2026-03-{day:02}T{hour + 1:02}:00:00Z"}}


def _series_of(identifier, day):
    return f"{identifier}_202603{day:02}T090000Z"


# --- what is there at the beginning

def fill_calendar(provider, history):
    """Six events, one of them a series with two exceptions and a cancelled day, and four tasks."""
    for n in range(1, 6):
        text = f"event-{n} of the server"
        provider.admin("POST", events_path(EMAIL), {
            "id": f"event{n}", "summary": text, "location": f"Room {n}",
            "attendees": [{"email": "guest@lab.example", "responseStatus": "accepted"}],
            "reminders": {"useDefault": False, "overrides": [{"method": "popup", "minutes": 10}]}, **_times(n)})
        history.wrote(text, f"event{n}")
    provider.admin("POST", events_path(EMAIL), {
        "id": "series1", "summary": "A series", "recurrence": ["RRULE:FREQ=DAILY;COUNT=9"], **_times(10)})
    for day in (11, 13):
        text = f"exception-{day} of the server"
        provider.admin("PATCH", f"{events_path(EMAIL)}/{_series_of('series1', day)}", {"summary": text})
        history.wrote(text, _series_of("series1", day))
    provider.admin("DELETE", f"{events_path(EMAIL)}/{_series_of('series1', 15)}")
    for n in range(1, 5):
        text = f"task-{n} of the server"
        provider.admin("POST", tasks_path(EMAIL, LIST), {"id": f"task{n}", "title": text, "notes": "a\nb",
                                                        "due": f"2026-05-0{n}T00:00:00Z"})
        history.wrote(text, f"task{n}")


def _membership(group):
    return {"href": f"/m8/feeds/groups/default/base/{group}"}


def fill_contacts(provider, history):
    """Eight contacts in two groups, two with a photo."""
    for n in (1, 2):
        provider.admin("POST", people_path(EMAIL, "groups"), {"id": f"group{n}", "title": {"$t": f"group-{n} of the server"}})
        history.wrote(f'<group-{n} of the server>', f"group{n}")
    for n in range(1, 9):
        text = f"contact-{n} of the server"
        provider.admin("POST", people_path(EMAIL, "contacts"), {
            "id": f"contact{n}", "gd$name": {"gd$givenName": {"$t": text}, "gd$familyName": {"$t": "Lab"}},
            "gd$email": [{"rel": KIND + "home", "address": f"c{n}@lab.example"}],
            "gd$phoneNumber": [{"rel": KIND + "mobile", "$t": f"+49 {n}", "primary": "true"}],
            "gContact$occupation": {"$t": "what the device cannot show"},
            "gContact$groupMembershipInfo": [_membership("6"), _membership(f"group{n % 2 + 1}")]})
        history.wrote(text, f"contact{n}")
    for n in (1, 2):
        provider.put_bytes(f"{people_path(EMAIL, 'contacts')}/contact{n}/photo", PNG + b"photo %d" % n)


FILL = {"calendar": fill_calendar, "contacts": fill_contacts}


# --- a change of each kind on the server

def change_calendar_on_server(provider, history):
    path = events_path(EMAIL)
    provider.admin("POST", path, {"id": "event9", "summary": "event-9 new on the server", **_times(20)})
    provider.admin("PATCH", f"{path}/event1", {"location": "room-1 changed on the server"})
    provider.admin("DELETE", f"{path}/event2")
    provider.admin("PATCH", f"{path}/{_series_of('series1', 11)}", {"location": "exception-11 moved by the server"})
    provider.admin("PATCH", f"{path}/{_series_of('series1', 12)}", {"summary": "exception-12 new on the server"})
    provider.admin("DELETE", f"{path}/{_series_of('series1', 13)}")
    provider.admin("PATCH", f"{path}/series1", {"description": "series-1 changed on the server"})
    provider.admin("POST", path, {"id": "series2", "summary": "series-2 new on the server",
                                 "recurrence": ["RRULE:FREQ=DAILY;COUNT=9"], **_times(1)})
    provider.admin("PATCH", f"{path}/{_series_of('series2', 3)}", {"summary": "exception-3 new on the server"})
    for text in ("event-9 new", "room-1 changed", "series-2 new", "exception-3 new"):
        history.wrote(f"{text} on the server")
    history.wrote("series-1 changed on the server", "series1")
    history.wrote("exception-12 new on the server", _series_of("series1", 12))
    history.wrote("exception-11 moved by the server")
    history.removed("event-2 of the server")
    history.removed("exception-13 of the server")
    tasks = tasks_path(EMAIL, LIST)
    provider.admin("POST", tasks, {"id": "task9", "title": "task-9 new on the server"})
    provider.admin("PATCH", f"{tasks}/task1", {"notes": "task-1 changed on the server", "status": "completed"})
    provider.admin("DELETE", f"{tasks}/task2")
    history.wrote("task-9 new on the server")
    history.wrote("task-1 changed on the server")
    history.removed("task-2 of the server")


def change_contacts_on_server(provider, history):
    contacts, groups = people_path(EMAIL, "contacts"), people_path(EMAIL, "groups")
    provider.admin("POST", groups, {"id": "group9", "title": {"$t": "group-9 new on the server"}})
    provider.admin("PATCH", f"{groups}/group1", {"title": {"$t": "group-1 changed on the server"}})
    provider.admin("DELETE", f"{groups}/group2")
    provider.admin("POST", contacts, {"id": "contact9", "gd$name": {"gd$givenName": {"$t": "contact-9 new on the server"}},
                                     "gContact$groupMembershipInfo": [_membership("group9")]})
    provider.put_bytes(f"{contacts}/contact9/photo", PNG + b"photo 9")
    provider.admin("PATCH", f"{contacts}/contact1", {"content": {"$t": "contact-1 changed on the server"}})
    provider.put_bytes(f"{contacts}/contact1/photo", PNG + b"photo 1 changed")
    provider.admin("DELETE", f"{contacts}/contact2/photo")
    provider.admin("DELETE", f"{contacts}/contact3")
    provider.admin("DELETE", f"{contacts}/contact4?deleted=listed")
    provider.put_bytes(f"{contacts}/contact5/photo", PNG + b"photo 5")
    history.wrote("contact-9 new on the server")
    history.wrote("contact-1 changed on the server", "contact1")
    history.wrote("<group-9 new on the server>")
    history.wrote("<group-1 changed on the server>", "group1")
    for text in ('<group-1 of the server>', '<group-2 of the server>', "contact-3 of the server", "contact-4 of the server"):
        history.removed(text)


CHANGE_ON_SERVER = {"calendar": change_calendar_on_server, "contacts": change_contacts_on_server}


# --- a change of each kind on the device

def change_calendar_on_device(device, history):
    book = {b["kind"]: str(b["id"]) for b in device.json("calendars", "list")}
    event = {e["uid"]: str(e["id"]) for e in device.json("events", "list")}
    todo = {t["uid"]: str(t["id"]) for t in device.json("todos", "list")}
    device.tool("event", "add", "--calendar", book["event"], "-", text=json.dumps({
        "summary": "event-20 new on the device", "start": "2026-04-01T09:00:00Z", "end": "2026-04-01T10:00:00Z"}))
    series = device.tool("event", "add", "--calendar", book["event"], "-", text=json.dumps({
        "summary": "series-21 new on the device", "start": "2026-04-01T09:00:00Z", "end": "2026-04-01T10:00:00Z",
        "rrule": "FREQ=DAILY;COUNT=9"}))
    device.tool("event", "set", series, "--instance", "20260403T090000Z", "summary=exception-22 new on the device")
    device.tool("event", "delete", series, "--instance", "20260404T090000Z")
    device.tool("event", "set", event["event3"], "location=room-3 changed on the device")
    device.tool("event", "delete", event["event4"])
    device.tool("event", "set", event["series1"], "--instance", "20260312T090000Z", "summary=exception-12 new on the device")
    device.tool("event", "delete", event["series1"], "--instance", "20260314T090000Z")
    for text in ("event-20 new", "series-21 new", "exception-22 new", "room-3 changed", "exception-12 new"):
        history.wrote(f"{text} on the device")
    history.removed("event-4 of the server")
    device.tool("todo", "add", "--calendar", book["todo"], "-", text=json.dumps({"summary": "task-20 new on the device"}))
    device.tool("todo", "set", todo["task3"], "note=task-3 changed on the device", "status=completed")
    device.tool("todo", "delete", todo["task4"])
    history.wrote("task-20 new on the device")
    history.wrote("task-3 changed on the device")
    history.removed("task-4 of the server")


def change_contacts_on_device(device, history):
    groups = {g["name"]: g["id"] for g in device.json("groups", "list")}
    contact = {c["name"]["first"].partition(" ")[0]: str(c["id"]) for c in device.json("contacts", "list")}
    photo = device.root / "photo.png"
    photo.write_bytes(PNG + b"photo of the device")
    new_group = device.tool("group", "add", "--account", "1", "-", text=json.dumps({"name": "group-20 new on the device"}))
    device.tool("group", "set", str(groups["group-1 of the server"]), "name=group-1 changed on the device")
    device.tool("group", "delete", str(groups["group-2 of the server"]))
    device.tool("contact", "add", "--account", "1", "-", text=json.dumps({
        "name": {"first": "contact-20 new on the device"}, "note": "x", "groups": [int(new_group)], "photo": str(photo),
        "phones": [{"value": "+49 20", "type": "mobile"}]}))
    device.tool("contact", "set", contact["contact-5"], "note=contact-5 changed on the device")
    device.tool("contact", "set", contact["contact-6"], f"groups=[{new_group}]", f"photo={photo}")
    device.tool("contact", "set", contact["contact-1"], "photo=")
    device.tool("contact", "delete", contact["contact-7"])
    for text in ("contact-20 new", "contact-5 changed"):
        history.wrote(f"{text} on the device")
    for text in ("group-20 new", "group-1 changed"):
        history.wrote(f"<{text} on the device>")
    for text in ("contact-7 of the server", '<group-1 of the server>', '<group-2 of the server>'):
        history.removed(text)


CHANGE_ON_DEVICE = {"calendar": change_calendar_on_device, "contacts": change_contacts_on_device}
