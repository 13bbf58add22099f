"""What the daemon costs when nothing is to be done, and how soon it answers."""
import os
import time

from programs import program

IDLE_SECONDS = 60
STATE_CALLS = 5000


def _switches(pid):
    """Times that a thread of the process was put to sleep, which is how often it had been woken."""
    total = 0
    for task in os.listdir(f"/proc/{pid}/task"):
        with open(f"/proc/{pid}/task/{task}/status") as file:
            total += sum(int(line.split()[1]) for line in file if line.startswith("voluntary_ctxt_switches"))
    return total


def measure(bench, case, runs):
    """With the case's items known to the device."""
    device = bench.device(case)
    try:
        device.measure("sync", case.kind)
        synced = device.memory()
        answers, latencies = [], []
        for _ in range(runs):
            device.stop()
            answers.append(device.measure("start", program("vantor-pim-sync"))["firstAnswerMs"])
            latencies.append(device.measure("state", STATE_CALLS))
        time.sleep(2)
        pid = device.pid()
        before = _switches(pid)
        time.sleep(IDLE_SECONDS)
        return {"wakesPerMinute": (_switches(pid) - before) * 60 / IDLE_SECONDS, "started": device.memory(),
                "synced": synced, "firstAnswerMs": answers, "stateUs": [entry["medianUs"] for entry in latencies],
                "stateP99Us": [entry["p99Us"] for entry in latencies]}
    finally:
        device.close()
