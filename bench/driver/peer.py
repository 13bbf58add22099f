"""vdirsyncer with the same number of items, from ready-made CalDAV and CardDAV answers to files in memory."""
import os
import shutil
import statistics
import time

from programs import run

CONFIG = """[general]
status_path = "{folder}/status"

[pair items]
a = "device"
b = "server"
collections = null

[storage device]
type = "filesystem"
path = "{folder}/items"
fileext = "{suffix}"

[storage server]
type = "{kind}"
url = "{url}/dav/{path}/"
"""


class Peer:
    def __init__(self, folder, server, case):
        self.folder = folder
        os.makedirs(folder + "/items")
        self.config = folder + "/config"
        is_contacts = case.contacts > 0
        with open(self.config, "w") as file:
            file.write(CONFIG.format(folder=folder, url=server.url, kind="carddav" if is_contacts else "caldav",
                                     path="contacts" if is_contacts else "events", suffix=".vcf" if is_contacts else ".ics"))
        run(["vdirsyncer", "-c", self.config, "discover"], text="y\ny\n")

    def sync(self):
        usage = os.times()
        begin = time.monotonic()
        run(["vdirsyncer", "-c", self.config, "sync"])
        wall = (time.monotonic() - begin) * 1e3
        after = os.times()
        cpu = (after.children_user + after.children_system - usage.children_user - usage.children_system) * 1e3
        return {"wallMs": wall, "cpuMs": cpu}

    def held(self):
        return len(os.listdir(self.folder + "/items"))

    def close(self):
        shutil.rmtree(self.folder, ignore_errors=True)


def round_of(bench, case):
    """First sync and sync without changes."""
    peer = Peer(bench.path(case), bench.servers[case], case)
    try:
        results = {"first sync": peer.sync()}
        if peer.held() != case.items:
            raise RuntimeError(f"{case.name}: the peer holds {peer.held()} items")
        results["no changes"] = peer.sync()
        return results
    finally:
        peer.close()


def start_ms():
    """What of its time is the start of its interpreter: the median of a few."""
    times = []
    for _ in range(5):
        begin = time.monotonic()
        run(["vdirsyncer", "--version"])
        times.append((time.monotonic() - begin) * 1e3)
    return statistics.median(times)


def serves(case):
    return not (case.uploads or case.tasks or case.tls)
