"""Many syncs of one daemon, with changes in both directions before each: it needs no more at the end than at the beginning, and
nothing got lost on the way."""
import json
import os
import time
from dataclasses import dataclass

from faultlab import account, checker, points
from faultlab.provider import people_path
from faultlab.random_kills import FIELDS, SERIES, DeviceEditor, ServerEditor
from faultlab.synced import synced

SETTLED = 50  # syncs until everything has its size
EDITED_AFTER, DELETED_AFTER = 2, 5
# The stores keep a line of each deletion (262,144 at most) and of each of their last 4096 writes.
DELETIONS, DELETION_BYTES, WRITES_KB = 6, 64, 200
SYNC_S = 600  # under the leak check
LEAK_CHECK = ["valgrind", "--quiet", "--leak-check=full", "--show-leak-kinds=definite", "--errors-for-leak-kinds=definite",
              "--error-exitcode=99"]
DAYS = {"device": (10, 11, 12), "server": (16, 17, 18)}


@dataclass(frozen=True)
class Run:
    seed: int
    syncs: int
    valgrind: bool

    def replay(self):
        return f"lab/run --scenario long-run --syncs {self.syncs}{' --valgrind' if self.valgrind else ''} --keep"

    def folder(self):
        return "kept-long-run"


@dataclass
class Item:
    """It is made by one side; the other edits it, and deletes it later. The number of items stays the same."""
    kind: str
    maker: str
    texts: list
    ids: dict


OTHER = {"device": "server", "server": "device"}


class Changes:
    def __init__(self, provider, device, history, seed):
        self._provider, self._device, self._history = provider, device, history
        self._editors = {"device": DeviceEditor(seed, history, device), "server": ServerEditor(seed, history, provider)}
        self._series = next(str(e["id"]) for e in device.json("events", "list") if e["uid"] == SERIES)
        self._items = []      # made before each sync
        self._instances = {}  # of each day the last text

    def make(self):
        number = len(self._items)
        self._items.append([])
        for side, editor in self._editors.items():
            for kind in FIELDS:
                text = f"{kind} {number} of the {side}."
                item = Item(kind, side, [text], {side: editor.make_item(kind, text)})
                self._history.wrote(text)
                self._items[-1].append(item)
                if kind == "contact":
                    self._add_photo(item, account.PNG + text.encode())
            self._edit_instance(side, number)
        for item in self._made_before(EDITED_AFTER):
            item.texts.append(f"edit {number} of {item.texts[0]}")
            if not self._other(item).edit(item.kind, item.ids[OTHER[item.maker]], item.texts[-1]):
                raise RuntimeError(f"{item.texts[0]!r} is gone")
            self._history.wrote(item.texts[-1])
        for item in self._made_before(DELETED_AFTER):
            self._other(item).remove_item(item.kind, item.ids[OTHER[item.maker]])
            for text in item.texts:
                self._history.removed(text)

    def learn_ids(self):
        """What the other side calls the new items, once they have arrived."""
        lists = {"device": {kind: self._device.json(f"{kind}s", "list") for kind in FIELDS},
                 "server": {"event": self._provider.events(account.EMAIL), "todo": self._provider.tasks(account.EMAIL, account.LIST),
                            "contact": self._provider.people(account.EMAIL, "contacts")}}
        for item in self._items[-1]:
            other = OTHER[item.maker]
            found = [i["id"] for i in lists[other][item.kind] if item.texts[0] in json.dumps(i)]
            if len(found) != 1:
                raise RuntimeError(f"{item.texts[0]!r} is {len(found)} times on the {other} after its sync")
            item.ids[other] = str(found[0])

    def _made_before(self, syncs):
        return self._items[-1 - syncs] if len(self._items) > syncs else []

    def _other(self, item):
        return self._editors[OTHER[item.maker]]

    def _add_photo(self, item, image):
        if item.maker == "server":
            return self._provider.put_bytes(f"{people_path(account.EMAIL, 'contacts')}/{item.ids['server']}/photo", image)
        path = self._device.root / "photo.png"
        path.write_bytes(image)
        return self._device.tool("contact", "set", item.ids["device"], f"photo={path}")

    def _edit_instance(self, side, number):
        days = DAYS[side]
        instance = f"202603{days[number % len(days)]}T090000Z"
        text = f"instance {number} of the {side}."
        item = (self._series, instance) if side == "device" else f"{SERIES}_{instance}"
        if not self._editors[side].edit("event", item, text):
            raise RuntimeError(f"the instance {instance} is gone")
        if instance in self._instances:
            self._history.removed(self._instances[instance])
        self._instances[instance] = text
        self._history.wrote(text)


def measure(device):
    with open(f"/proc/{device.pid()}/status", encoding="ascii") as status:
        memory = next(int(line.split()[1]) for line in status if line.startswith("VmRSS"))
    files = sum(f.stat().st_size for f in device.root.rglob("*") if f.is_file())
    return {"memory (kB)": memory, "descriptors": len(os.listdir(f"/proc/{device.pid()}/fd")), "files (kB)": files // 1024}


def median(values):
    return sorted(values)[len(values) // 2]


def judge_growth(samples, outcome):
    """The last syncs need no more than the first ones did. Single samples may catch the daemon at work."""
    late_deletions = DELETIONS * max(len(samples) - SETTLED, 0)
    slack = {"memory (kB)": 256, "descriptors": 0, "files (kB)": WRITES_KB + late_deletions * DELETION_BYTES // 1024}
    outcome.notes += ["| what | first sync | highest until sync 50 | highest after it | median of the last 50 |", "|---|---|---|---|---|"]
    for what in samples[0]:
        values = [sample[what] for sample in samples]
        early, late, last = max(values[:SETTLED]), max(values[SETTLED:], default=0), median(values[-SETTLED:])
        outcome.notes.append(f"| {what} | {values[0]} | {early} | {late} | {last} |")
        if last > early + slack[what]:
            outcome.problems.append(f"{what}: {early} at most in the first {SETTLED} syncs, {last} in the last")


def sync_many(run, changes, device, outcome):
    samples, seconds = [], []
    for number in range(run.syncs):
        changes.make()
        begun = time.monotonic()
        status, output = device.sync(timeout=SYNC_S)
        seconds.append(time.monotonic() - begun)
        if status != 0:
            outcome.problems.append(f"sync {number} failed: {output.strip()}")
            return
        changes.learn_ids()
        samples.append(measure(device))
    outcome.notes.append(f"{run.syncs} syncs, {median(seconds) * 1000:.0f} ms each (median)")
    if not run.valgrind:
        judge_growth(samples, outcome)


def trial_of(worker, run):
    outcome = points.Outcome(run, hit="run")
    with synced(worker) as trial:
        device, provider, history = trial
        device.wrapper = LEAK_CHECK if run.valgrind else []
        device.start()
        sync_many(run, Changes(provider, device, history, run.seed), device, outcome)
        if not outcome.problems and points.sync_until_quiet(trial, "all", outcome):
            outcome.problems += checker.judge(provider, device, {1: history}, ["calendar", "contacts"])
        if not device.stop(SYNC_S) or device.exit_status() != 0:
            outcome.problems.append(f"the daemon ended with {device.exit_status()}; its log has the leak check's words")
    return outcome


def run(workers, table, arguments):
    if arguments.short:
        return
    for outcome in workers.trials(trial_of, [Run(arguments.seed, arguments.syncs, arguments.valgrind)]):
        table.add(("long-run", "all", f"{arguments.syncs} syncs{' under valgrind' if arguments.valgrind else ''}", 0), outcome)
        print("\n".join(outcome.notes))
