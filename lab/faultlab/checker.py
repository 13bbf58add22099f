"""The claim: after quiet, every acknowledged write of either side is on both sides exactly once, or the log says why not."""
import json
import pathlib
from collections import Counter

from faultlab import calendar_reading, contact_reading

SHOWN = 300


def _compare_by_id(what, wire, pairs):
    problems = []
    left = dict(wire)
    for uid, item in pairs:
        expected = left.pop(uid, None)
        if expected is None:
            problems.append(f"{what} {uid!r} is on the device but not on the server, or twice: {str(item)[:SHOWN]}")
        elif expected != item:
            fields = [f"{k}: {item[k]!r} on the device, {expected[k]!r} on the server" for k in item if item[k] != expected[k]]
            problems.append(f"{what} {uid!r} differs: {'; '.join(fields)}")
    problems += [f"{what} {uid!r} is not on the device: {str(item)[:SHOWN]}" for uid, item in left.items()]
    return problems


def _compare_counts(what, wire, device):
    problems = []
    for text in sorted(set(wire) | set(device)):
        if wire[text] != device[text]:
            problems.append(f"{what}: {device[text]} on the device, {wire[text]} on the server: {text[:4 * SHOWN]}")
    return problems


class Sides:
    """What both sides hold of one account."""

    def __init__(self, provider, device, number=1):
        self._provider, self._device = provider, device
        self._number = str(number)
        self._email = provider.ready["accounts"][number - 1]["email"]
        self.wire_text, self.device_text = [], []

    def _list(self, kind):
        return self._device.json(kind, "list", "--account", self._number)

    def calendar_problems(self):
        books = self._list("calendars")
        events, todos = self._list("events"), self._list("todos")
        self.device_text += [json.dumps(item, ensure_ascii=False) for item in events + todos]
        calendars = self._provider.calendars(self._email)
        lists = self._provider.task_lists(self._email)
        problems = _compare_counts("calendar", Counter(c["summary"] for c in calendars),
                                   Counter(b["name"] for b in books if b["kind"] == "event"))
        problems += _compare_counts("task list", Counter(t["title"] for t in lists),
                                    Counter(b["name"] for b in books if b["kind"] == "todo"))
        if problems:
            return problems
        id_of = {(book["kind"], book["name"]): book["id"] for book in books}
        for calendar in calendars:
            items = self._provider.events(calendar["id"])
            self.wire_text += [json.dumps(i, ensure_ascii=False) for i in items if i["status"] != "cancelled"]
            own = [e for e in events if e["calendar"] == id_of["event", calendar["summary"]]]
            problems += _compare_by_id("event", calendar_reading.wire_events(items), calendar_reading.device_events(own))
        for task_list in lists:
            items = self._provider.tasks(self._email, task_list["id"])
            self.wire_text += [json.dumps(item, ensure_ascii=False) for item in items]
            own = [t for t in todos if t["calendar"] == id_of["todo", task_list["title"]]]
            problems += _compare_by_id("task", calendar_reading.wire_tasks(items), calendar_reading.device_todos(own))
        return problems

    def contact_problems(self):
        wire_groups = {g["id"]: g["title"]["$t"] for g in self._provider.people(self._email, "groups")}
        device_groups = {g["id"]: g["name"] for g in self._list("groups")}
        problems = _compare_counts("group", Counter(wire_groups.values()), Counter(device_groups.values()))
        wire = Counter()
        for entry in self._provider.people(self._email, "contacts"):
            photo = self._provider.photo(self._email, entry["id"]) if entry.get("photo") else b""
            wire[contact_reading.wire_contact(entry, wire_groups, photo)] += 1
        device = Counter()
        for contact in self._list("contacts"):
            photo = pathlib.Path(contact["photo"]).read_bytes() if contact["photo"] else b""
            device[contact_reading.device_contact(contact, device_groups, photo)] += 1
        # A contact names its groups; in angles a name is the group itself.
        self.wire_text += [*wire.elements(), *(f"<{name}>" for name in wire_groups.values())]
        self.device_text += [*device.elements(), *(f"<{name}>" for name in device_groups.values())]
        problems += [f"contact twice: {text[:SHOWN]}" for text, count in wire.items() if count > 1]
        return problems + _compare_counts("contact", wire, device)

    def problems(self, kinds):
        problems = self.calendar_problems() if "calendar" in kinds else []
        return problems + (self.contact_problems() if "contacts" in kinds else [])


def quiet_problems(provider, device, numbers, kinds):
    """One more sync sends no write and changes no store."""
    provider.forget_requests()
    before = device.store_contents()
    problems = []
    for number in numbers:
        for kind in kinds:
            status, output = device.sync(number, kind)
            if status != 0:
                problems.append(f"the quiet {kind} sync of account {number} failed: {output.strip()}")
    problems += [f"the quiet sync sent {write}" for write in provider.writes()]
    after = device.store_contents()
    problems += [f"the quiet sync changed {name}" for name in after if after[name] != before.get(name)]
    return problems


def judge(provider, device, histories, kinds):
    """All breaches of the claim; empty when it holds. `histories` has one for each account's number."""
    problems = []
    log = device.log()
    for number, history in histories.items():
        sides = Sides(provider, device, number)
        found = sides.problems(kinds)
        found += history.problems("server", sides.wire_text, log)
        found += history.problems("device", sides.device_text, log)
        problems += [f"account {number}: {problem}" for problem in found]
    return problems + quiet_problems(provider, device, list(histories), kinds)
