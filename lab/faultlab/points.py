"""A trial at one step: the daemon is disturbed there, comes back, syncs, and is judged."""
import json
import time
from collections import Counter
from dataclasses import dataclass, field

from faultlab import checker

SYNCS = 4  # after the disturbance, for quiet: a failed one, one that sends, one that sees what became of it, and one more
DISTURBED_SYNC_S = 20
FAILING_SYNC_S = 10
LOOK_S = 0.02
THREADS = {"main": "main", "worker": "sync-worker"}


@dataclass(frozen=True)
class Point:
    scenario: str
    thread: str
    at: int
    action: str = "kill"
    length: int = 0  # of failing calls; 0 is until healed

    def options(self):
        return ["--thread", THREADS[self.thread], "--at", str(self.at), "--action", self.action, "--length", str(self.length)]

    def folder(self):
        return f"kept-{self.scenario}-{self.thread}-{self.at}-{self.action}-{self.length}"

    def replay(self):
        text = f"lab/run --scenario {self.scenario} --thread {self.thread} --at {self.at}"
        if self.action != "kill":
            text += f" --action {self.action} --length {self.length}"
        return text + " --keep"


@dataclass
class Outcome:
    point: Point
    hit: str = ""  # the call, empty when the run ended before the step
    problems: list = field(default_factory=list)
    notes: list = field(default_factory=list)
    failed_syncs: int = 0  # after the disturbance was over


def sync_until_quiet(trial, kind, outcome):
    """Whether a sync ended well and sent nothing, within the tries."""
    device, provider = trial.device, trial.provider
    for _ in range(SYNCS):
        if not device.is_running():
            device.start()
        provider.forget_requests()
        status, output = device.sync(1, kind)
        if status == 0 and not provider.writes():
            return True
        if status != 0:
            outcome.failed_syncs += 1
            outcome.notes.append(output.strip())
    outcome.problems.append(f"{SYNCS} syncs did not come to rest: {'; '.join(outcome.notes)}")
    return False


def _run_with_failing_disk(device, kind):
    """Until the run is over; the daemon may be unable to publish that, so its state is asked for."""
    device.run("sync", "1", kind)
    end = time.monotonic() + FAILING_SYNC_S
    while device.is_running() and time.monotonic() < end:
        status, output = device.run("status", "1", "--json")
        states = [entry["state"] for entry in json.loads(output)] if status == 0 else []
        if "in progress" not in states:
            return
        time.sleep(LOOK_S)


def _disturbed_run(trial, kind, point, outcome):
    device = trial.device
    device.start(point.options())
    if point.action == "kill":
        device.sync(1, kind, DISTURBED_SYNC_S)
        if not device.stop():
            outcome.problems.append("the daemon did not end when it was told to")
    else:
        _run_with_failing_disk(device, kind)
        device.heal()
    report = device.report()
    outcome.hit = next((line[4:] for line in report if line.startswith("hit ")), "")
    signals = [line for line in report if line.startswith("ended signal")]
    if signals and point.action != "kill":
        outcome.problems.append(f"the daemon crashed: {signals[0]}")
    elif point.action != "kill" and not device.is_running():
        outcome.notes.append("the daemon gave up")


def run(trial, scenario, point):
    outcome = Outcome(point)
    with trial:
        _disturbed_run(trial, scenario.kind, point, outcome)
        if sync_until_quiet(trial, scenario.kind, outcome):
            outcome.problems += checker.judge(trial.provider, trial.device, {1: trial.history}, [scenario.kind])
        if outcome.problems:
            outcome.notes += trial.device.log().splitlines()[-40:]
    return outcome


def count(trial, scenario):
    """The steps of a run that nobody disturbs: how many each thread has, and which of them can fail."""
    with trial:
        trial.device.start([])
        status, output = trial.device.sync(1, scenario.kind)
        trial.device.stop()
        if status != 0:
            raise RuntimeError(f"{scenario.name} fails undisturbed: {output}")
        steps = [line.split(" ", 5)[1:] for line in trial.device.report() if line.startswith("step ")]
    counts = Counter(name for name, *_ in steps)
    fallible = {thread: [int(number) for name, number, _, can_fail, _ in steps
                         if name == THREADS[thread] and can_fail == "1"] for thread in THREADS}
    return {thread: counts[THREADS[thread]] for thread in THREADS}, fallible
