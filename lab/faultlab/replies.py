"""The network in the middle of each request: no reply, a reply lost after the work was done, half a reply, and a kill on top."""
import re
import time
from collections import Counter
from dataclasses import dataclass

from faultlab import checker, points
from faultlab.scenarios import SCENARIOS

SHORT_STRIDE = 29
LONG_MS = 20000
FAULTS = {
    "reset": {"kind": "reset"},
    "reply lost": {"kind": "reset", "afterHandling": True},
    "reply cut": {"kind": "cut"},
    "503 after the work": {"kind": "status", "status": 503, "afterHandling": True},
    "reply lost and killed": {"kind": "delay", "delayMs": LONG_MS, "afterHandling": True},
}
EVERY_REQUEST = [f"{phase}-{kind}" for kind in ("calendar", "contacts") for phase in ("first", "compare", "upload")]


@dataclass(frozen=True)
class Request:
    scenario: str
    at: int  # among all trials
    method: str
    path: str
    count: int
    fault: str

    def replay(self):
        return f"lab/run --scenario replies --at {self.at} --keep"

    def folder(self):
        return f"kept-replies-{self.at}"

    def body(self):
        exact = re.sub(r"([.^$*+?()\[\]{}|\\])", r"\\\1", self.path)
        return {"method": self.method, "path": f"^{exact}$", "count": self.count, **FAULTS[self.fault]}


def requests_of(worker, name):
    """What an undisturbed run asks, each with how often."""
    scenario = SCENARIOS[name]
    with worker.trial(scenario) as trial:
        trial.device.start()
        trial.provider.forget_requests()
        trial.device.sync(1, scenario.kind)
        return Counter((r["method"], r["path"]) for r in trial.provider.requests())


def _disturbed_run(trial, kind, request):
    device, provider = trial.device, trial.provider
    provider.admin("POST", "/faults", request.body())
    if not request.fault.endswith("killed"):
        device.sync(1, kind)
        return
    device.run("sync", "1", kind)
    end = time.monotonic() + 5
    while provider.admin("GET", "/faults")["faults"] and time.monotonic() < end:
        time.sleep(0.005)
    time.sleep(0.02)  # the work is done while the reply waits
    device.kill()


def trial_of(worker, request):
    scenario = SCENARIOS[request.scenario]
    outcome = points.Outcome(request, hit=f"{request.method} {request.path}")
    with worker.trial(scenario) as trial:
        trial.device.start()
        _disturbed_run(trial, scenario.kind, request)
        if trial.provider.admin("GET", "/faults")["faults"]:
            outcome.hit = ""
        trial.provider.admin("DELETE", "/faults")
        if points.sync_until_quiet(trial, scenario.kind, outcome):
            outcome.problems += checker.judge(trial.provider, trial.device, {1: trial.history}, [scenario.kind])
    return outcome


def run(workers, table, arguments):
    trials = []
    counts = list(workers.each(requests_of, EVERY_REQUEST))
    for name, requests in zip(EVERY_REQUEST, counts):
        for (method, path), often in sorted(requests.items()):
            for count in sorted({1, often}):
                trials += [Request(name, len(trials) + n, method, path, count, fault) for n, fault in enumerate(FAULTS)]
    chosen = trials[::SHORT_STRIDE] if arguments.short else trials[::arguments.stride]
    if arguments.at is not None:
        chosen = [trials[arguments.at]]
    for outcome in workers.trials(trial_of, chosen):
        table.add((outcome.point.scenario, "each request", outcome.point.fault, 0), outcome)
