"""Kills at random times while both sides are edited without a pause. Each side has items of its own, whose every text must
arrive; some items both edit, each side another field, and when a text of those is lost the log must name the item."""
import json
import random
import threading
import time
from dataclasses import dataclass

from faultlab import account, checker, points
from faultlab.device import ToolFailed
from faultlab.provider import Refused, events_path, people_path, tasks_path
from faultlab.synced import synced

KILLS = 30
SHORT_KILLS = 10
SHORT_RUNS, RUNS = 1, 4
SERIES = "series1"
INSTANCES = [f"202603{day}T090000Z" for day in (10, 11, 12, 14, 16, 17, 18)]  # 13 and 15 are the other side's
BOTH_EDIT = {"event5", "task4", "contact8"}
FIELDS = {"event": "location", "todo": "note", "contact": "nickname"}


@dataclass(frozen=True)
class Run:
    seed: int
    kills: int

    def replay(self):
        return f"lab/run --scenario random-kills --seed {self.seed} --at {self.kills} --keep"

    def folder(self):
        return f"kept-random-kills-{self.seed}"


class Editor(threading.Thread):
    """One side's edits, until told to end. Only what was acknowledged is expected to arrive."""

    side = ""

    def __init__(self, seed, history):
        super().__init__()
        self._random = random.Random(seed)
        self._history = history
        self._texts = {}  # of each item the last text
        self._made = []
        self._count = 0
        self.must_end = threading.Event()
        self.failure = None

    def run(self):
        try:
            while not self.must_end.is_set():
                self._count += 1
                self._step(self._random.random())
                time.sleep(self._random.random() * 0.05)
        except Exception as failure:  # told by the trial
            self.failure = failure

    def _step(self, choice):
        text = f"text {self._count} of the {self.side}."
        kind = self._random.choice(list(FIELDS))
        if choice < 0.3:
            item = self.make_item(kind, text)
            self._made.append((kind, item))
            self._texts[kind, item] = text
            self._history.wrote(text)
        elif choice < 0.4 and self._made:
            kind, item = self._made.pop(self._random.randrange(len(self._made)))
            if self.remove_item(kind, item):
                self._history.removed(self._texts.pop((kind, item)))
        else:
            self._edit_one(kind, text)

    def _edit_one(self, kind, text):
        item, uid = self._known(kind)
        if item is None:
            return
        before = self._texts.get((kind, item))
        if before:
            self._history.may_be_lost(before)
        if self.edit(kind, item, text):
            self._texts[kind, item] = text
            self._history.wrote(text, uid)


class DeviceEditor(Editor):
    side = "device"

    def __init__(self, seed, history, device):
        super().__init__(seed, history)
        self._device = device
        self._books = {b["kind"]: str(b["id"]) for b in device.json("calendars", "list")}
        self._own = {kind: [] for kind in FIELDS}
        for kind in ("event", "todo"):
            self._own[kind] = [(str(i["id"]), i["uid"]) for i in device.json(f"{kind}s", "list")]
        for contact in device.json("contacts", "list"):
            number = contact["name"]["first"].partition(" ")[0].replace("-", "")
            self._own["contact"].append((str(contact["id"]), number))
        for kind, items in self._own.items():
            self._own[kind] = [(i, uid) for i, uid in items if uid[-1] in "2468" or uid in BOTH_EDIT]
        series = next(str(e["id"]) for e in device.json("events", "list") if e["uid"] == SERIES)
        self._own["event"] += [((series, instance), f"{SERIES}_{instance}") for instance in INSTANCES]

    def make_item(self, kind, text):
        item = {"summary": text}
        if kind == "event":
            item.update(start="2026-04-01T09:00:00Z", end="2026-04-01T10:00:00Z")
        if kind == "contact":
            return self._device.tool("contact", "add", "--account", "1", "-", text=json.dumps({"name": {"first": text}}))
        return self._device.tool(kind, "add", "--calendar", self._books[kind], "-", text=json.dumps(item))

    def remove_item(self, kind, item):
        self._device.tool(kind, "delete", item)
        return True

    def _known(self, kind):
        return self._random.choice(self._own[kind])

    def edit(self, kind, item, text):
        try:
            where = [item] if isinstance(item, str) else [item[0], "--instance", item[1]]
            self._device.tool(kind, "set", *where, f"{FIELDS[kind]}={text}")
            return True
        except ToolFailed as failed:
            if "there is no" in str(failed):
                return False
            raise


class ServerEditor(Editor):
    side = "server"
    PATHS = {"event": events_path(account.EMAIL), "todo": tasks_path(account.EMAIL, account.LIST),
             "contact": people_path(account.EMAIL, "contacts")}
    KNOWN = {"event": ["event1", "event3", "event5"], "todo": ["task1", "task3", "task4"],
             "contact": ["contact1", "contact3", "contact5", "contact7", "contact8"]}

    def __init__(self, seed, history, provider):
        super().__init__(seed, history)
        self._provider = provider

    def make_item(self, kind, text):
        body = {"event": {"summary": text, "start": {"dateTime": "2026-03-20T09:00:00Z"},
                          "end": {"dateTime": "2026-03-20T10:00:00Z"}},
                "todo": {"title": text}, "contact": {"gd$name": {"gd$givenName": {"$t": text}}}}[kind]
        return self._provider.admin("POST", self.PATHS[kind], body)["id"]

    def remove_item(self, kind, item):
        self._provider.admin("DELETE", f"{self.PATHS[kind]}/{item}")
        return True

    def _known(self, kind):
        item = self._random.choice(self.KNOWN[kind])
        return item, item

    def edit(self, kind, item, text):
        body = {"event": {"description": text}, "todo": {"title": text}, "contact": {"content": {"$t": text}}}[kind]
        try:
            self._provider.admin("PATCH", f"{self.PATHS[kind]}/{item}", body)
            return True
        except Refused as refused:
            if "404" in str(refused) or "410" in str(refused):
                return False
            raise


def _kill_at_random(device, chance, kills):
    for _ in range(kills):
        if not device.is_running():
            device.start()
        if chance.random() < 0.7:
            device.run("sync", "1", "all")
        time.sleep(chance.random() * 0.6)
        device.kill()


def trial_of(worker, run):
    outcome = points.Outcome(run, hit="killed")
    with synced(worker) as trial:
        device, provider, history = trial
        for task in ServerEditor.KNOWN["todo"]:
            history.may_be_lost(f"task-{task[-1]} of the server")
        editors = [DeviceEditor(run.seed, history, device), ServerEditor(run.seed + 1, history, provider)]
        for editor in editors:
            editor.start()
        _kill_at_random(device, random.Random(run.seed), run.kills)
        for editor in editors:
            editor.must_end.set()
            editor.join()
            if editor.failure:
                outcome.problems.append(f"an edit failed: {editor.failure!r}")
        points.sync_until_quiet(trial, "all", outcome)
        outcome.problems += checker.judge(provider, device, {1: history}, ["calendar", "contacts"])
    return outcome


def run(workers, table, arguments):
    kills = arguments.at or (SHORT_KILLS if arguments.short else KILLS)
    runs = 1 if arguments.short or arguments.at else RUNS
    trials = [Run(arguments.seed + 10 * n, kills) for n in range(runs)]
    for outcome in workers.trials(trial_of, trials):
        table.add(("random-kills", "any", f"{kills} kills", 0), outcome)
