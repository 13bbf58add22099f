"""Two accounts that share a calendar and have the same system groups: in step at once, one removed, one without a token."""
import json
import threading
import time
from dataclasses import dataclass

from faultlab import checker, points
from faultlab.history import History
from faultlab.provider import Provider, events_path, people_path, tasks_path

EMAILS = {1: "one@lab.example", 2: "two@lab.example"}
SHARED = "both@lab.example"
CASES = ("at once", "one removed", "one token ended")
DELAYS_MS = range(0, 400, 40)
SEED = {"calendars": [{"id": c, "summary": c} for c in (*EMAILS.values(), SHARED)],
        "accounts": [{"email": email, "taskLists": [{"id": f"list-{n}", "title": f"List {n}"}],
                      "calendars": [{"id": email, "accessRole": "owner"}, {"id": SHARED, "accessRole": "writer"}]}
                     for n, email in EMAILS.items()]}


@dataclass(frozen=True)
class Case:
    name: str
    delay_ms: int
    at: int

    def replay(self):
        return f"lab/run --scenario accounts --at {self.at} --keep"

    def folder(self):
        return f"kept-accounts-{self.at}"


def _event(text, day):
    return {"summary": text, "start": {"dateTime": f"2026-03-{day:02}T09:00:00Z"},
            "end": {"dateTime": f"2026-03-{day:02}T10:00:00Z"}}


def _write_on_server(provider, round_number, histories):
    for number, email in EMAILS.items():
        day, mark = round_number * 5 + number, f"round {round_number} account {number}"
        for calendar, owners in ((email, [number]), (SHARED, [1, 2])):
            text = f"event of {calendar}, {mark}, server"
            provider.admin("POST", events_path(calendar), _event(text, day))
            for owner in owners:
                histories[owner].wrote(text)
        provider.admin("POST", tasks_path(email, f"list-{number}"), {"title": f"task, {mark}, server"})
        # The same ids in both accounts, as system groups have them.
        provider.admin("POST", people_path(email, "contacts"), {
            "id": f"contact{round_number}", "gd$name": {"gd$givenName": {"$t": f"contact, {mark}, server"}},
            "gContact$groupMembershipInfo": [{"href": "/m8/feeds/groups/default/base/6"}]})
        histories[number].wrote(f"task, {mark}, server")
        histories[number].wrote(f"contact, {mark}, server")


def _write_on_device(device, round_number, histories):
    for number in EMAILS:
        mark = f"round {round_number} account {number}"
        groups = [g["id"] for g in device.json("groups", "list", "--account", str(number)) if g["readOnly"]]
        for book in device.json("calendars", "list", "--account", str(number)):
            text = f"{book['kind']} in {book['name']}, {mark}, device"
            item = {"summary": text}
            if book["kind"] == "event":
                item.update(start="2026-04-01T09:00:00Z", end="2026-04-01T10:00:00Z")
            device.tool(book["kind"], "add", "--calendar", str(book["id"]), "-", text=json.dumps(item))
            for owner in [1, 2] if book["name"] == SHARED else [number]:
                histories[owner].wrote(text)
        device.tool("contact", "add", "--account", str(number), "-", text=json.dumps(
            {"name": {"first": f"contact, {mark}, device"}, "groups": groups[:1]}))
        histories[number].wrote(f"contact, {mark}, device")


def _sync_both(device):
    results = {}
    threads = [threading.Thread(target=lambda n=n: results.update({n: device.sync(n)})) for n in EMAILS]
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    return results


def _settle(device, numbers, outcome):
    """What one account sends to the shared calendar comes down with the next sync of the other."""
    for _ in range(2):
        for number in numbers:
            status, output = device.sync(number)
            if status != 0:
                outcome.problems.append(f"account {number} does not sync: {output.strip()}")


def _remove_first(trial, outcome):
    provider, device, histories = trial
    device.tool("account", "remove", "1")
    left = [len(device.json(kind, "list", "--account", "1")) for kind in ("calendars", "contacts", "groups")]
    if any(left):
        outcome.problems.append(f"the removed account left {left} calendars, contacts, groups on the device")
    _settle(device, [2], outcome)
    there = json.dumps(provider.admin("GET", "/dump"), ensure_ascii=False)
    outcome.problems += [f"the removal took {text!r} from the server"
                         for text in histories[1].texts("server") if text not in there]
    return {2: histories[2]}


def _end_token(trial, outcome):
    provider, device, histories = trial
    token = provider.admin("POST", "/tokens/issue", {"email": EMAILS[2]})["refreshToken"]
    device.tool("account", "update", "2", "--refresh-token-file", "-", text=token)
    _settle(device, [1, 2, 1], outcome)
    return histories


def trial_of(worker, case):
    outcome = points.Outcome(case, hit=case.name)
    device = worker.fresh_device()
    seed = device.root.parent / "provider.json"
    seed.write_text(json.dumps(SEED))
    histories = {n: History() for n in EMAILS}
    with Provider(worker.port, str(seed)) as provider:
        try:
            _write_on_server(provider, 1, histories)
            device.initialize(provider)
            for number in EMAILS:
                device.add_account(provider, number)
            device.tool("daemon", "stop")
            device.start()
            _sync_both(device)
            _write_on_server(provider, 2, histories)
            _write_on_device(device, 3, histories)
            both = threading.Thread(target=_sync_both, args=(device,))
            both.start()
            time.sleep(case.delay_ms / 1000)
            if case.name == "one token ended":
                provider.admin("POST", "/tokens/revoke", {"email": EMAILS[2]})
            if case.name == "one removed":
                histories = _remove_first((provider, device, histories), outcome)
            both.join()
            if case.name == "one token ended":
                histories = _end_token((provider, device, histories), outcome)
            else:
                _settle(device, list(histories), outcome)
            outcome.problems += checker.judge(provider, device, histories, ["calendar", "contacts"])
        finally:
            device.kill()
    return outcome


def run(workers, table, arguments):
    cases = [(name, delay) for name in CASES for delay in DELAYS_MS]
    trials = [Case(name, delay, at) for at, (name, delay) in enumerate(cases)]
    chosen = trials[::7] if arguments.short else trials
    if arguments.at is not None:
        chosen = [trials[arguments.at]]
    for outcome in workers.trials(trial_of, chosen):
        table.add(("accounts", "both", outcome.point.name, 0), outcome)
