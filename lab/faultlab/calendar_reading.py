"""Events and tasks of either side, brought to one form that can be compared: an independent reading of the wire."""
import datetime
import re

EVENT_FIELDS = ("summary", "description", "location", "start", "end", "timeZone", "status", "visibility", "busy",
                "organizer", "attendees", "reminders", "recurrenceId")
TODO_FIELDS = ("summary", "note", "due", "completed", "status")


def utc(time):
    """The laboratory writes whole hours of offset only."""
    if "date" in time:
        return time["date"]
    moment = datetime.datetime.fromisoformat(time["dateTime"].replace("Z", "+00:00"))
    return moment.astimezone(datetime.timezone.utc).strftime("%Y-%m-%dT%H:%M:%SZ")


def rule_parts(rule):
    parts = set(rule.removeprefix("RRULE:").split(";")) if rule else set()
    return sorted(parts - {"INTERVAL=1", "WKST=MO"})


def _attendee(person):
    email = person.get("email", "")
    return {"email": email, "name": person.get("displayName", email), "status": person.get("responseStatus", "needsAction")}


def _wire_event(item):
    organizer = item.get("organizer", {})
    return {
        "summary": item.get("summary", ""), "description": item.get("description", ""),
        "location": item.get("location", ""), "start": utc(item["start"]), "end": utc(item["end"]),
        "timeZone": item["end"].get("timeZone", item["start"].get("timeZone", "")),
        "status": item.get("status", ""), "busy": item.get("transparency", "opaque") == "opaque",
        "visibility": "private" if item.get("visibility") == "private" else "default",
        "organizer": {"name": organizer.get("displayName", ""), "email": organizer.get("email", "")},
        "attendees": [_attendee(person) for person in item.get("attendees", [])],
        "reminders": [r["minutes"] for r in item.get("reminders", {}).get("overrides", [])],
        "rrule": rule_parts((item.get("recurrence") or [""])[0]),
        "exdates": [], "originalEvent": None, "recurrenceId": ""}


def wire_events(items):
    """By server id. A cancelled instance is a date of its series, a changed one an exception."""
    events = {item["id"]: _wire_event(item) for item in items if "originalStartTime" not in item}
    for item in items:
        if "originalStartTime" not in item or item["recurringEventId"] not in events:
            continue
        start = utc(item["originalStartTime"])
        if item["status"] == "cancelled":
            events[item["recurringEventId"]]["exdates"].append(start)
            continue
        events[item["id"]] = dict(_wire_event(item), originalEvent=item["recurringEventId"],
                                  recurrenceId=re.sub("[-:]", "", start))
    for event in events.values():
        event["exdates"].sort()
    return events


def device_events(listed):
    """Pairs of server id and event: two records may have the same id, and that must be seen."""
    uid_of = {event["id"]: event["uid"] for event in listed}
    pairs = []
    for event in listed:
        comparable = {field: event[field] for field in EVENT_FIELDS}
        comparable["rrule"] = rule_parts(event["rrule"])
        comparable["exdates"] = sorted(event["exdates"])
        comparable["originalEvent"] = uid_of[event["originalEvent"]] if event["originalEvent"] else None
        pairs.append((event["uid"], comparable))
    return pairs


def wire_tasks(items):
    return {item["id"]: {"summary": item.get("title", ""), "note": item.get("notes", ""), "due": item.get("due", ""),
                         "completed": item.get("completed", "").replace(".000Z", "Z"),
                         "status": item.get("status", "needsAction")} for item in items}


def device_todos(listed):
    return [(todo["uid"], {field: todo[field] for field in TODO_FIELDS}) for todo in listed]
