"""What is measured: cases (an account of some size), works (what is done with it), and one round of each."""
import dataclasses
import itertools
import os

from programs import Device, Floor, FlushTrace, PageServer

UPLOADS = 1000
_numbers = itertools.count()


@dataclasses.dataclass(frozen=True)
class Case:
    name: str
    events: int = 0
    contacts: int = 0
    tasks: int = 0
    tls: bool = False
    uploads: int = 0
    on_disk: bool = False  # a durable write costs something only there

    @property
    def kind(self):
        return "contacts" if self.contacts else "calendar"

    @property
    def touched(self):
        return "contact" if self.contacts else "task" if self.tasks else "event"

    @property
    def table(self):
        return "contacts" if self.contacts else "todos" if self.tasks else "events"

    @property
    def items(self):
        return self.events + self.contacts + self.tasks + self.uploads

    @property
    def works(self):
        return ["uploads"] if self.uploads else ["first sync", "no changes", "one change"]


def events(count, tls=False):
    return Case(f"{count:,} events{', HTTPS' if tls else ''}", events=count, tls=tls)


def contacts(count, tls=False):
    return Case(f"{count:,} contacts{', HTTPS' if tls else ''}", contacts=count, tls=tls)


ALL = [events(1000), events(5000), events(20000), events(5000, tls=True), contacts(2000), contacts(10000),
       contacts(2000, tls=True), Case("1,000 tasks", tasks=1000),
       Case("1,000 uploads", uploads=UPLOADS), Case("1,000 uploads, HTTPS", uploads=UPLOADS, tls=True),
       Case("1,000 uploads, on a disk", uploads=UPLOADS, on_disk=True)]
QUICK = [events(1000), events(5000), contacts(2000)]


class Bench:
    """The page servers of all cases, and where the devices' files lie."""

    def __init__(self, folder, disk_folder, cases):
        self.folder = folder
        self.disk_folder = disk_folder
        self.servers = {}
        try:
            for case in cases:
                self.servers[case] = PageServer(case.events, case.contacts, case.tasks, case.tls)
                self._warm_up(case)
        except BaseException:
            self.close()
            raise

    def close(self):
        for server in self.servers.values():
            server.close()

    def path(self, case):
        return os.path.join(self.disk_folder if case.on_disk else self.folder, f"r{next(_numbers)}")

    def device(self, case):
        return Device(self.path(case), self.servers[case], contacts=case.contacts > 0)

    def floor(self, case):
        return Floor(self.path(case), self.servers[case])

    def _warm_up(self, case):
        """Lets every page be made, compressed and plain, that a sync will ask for."""
        for run in (self.product_round, self.floor_round):
            run(case)

    # --- one round of each side: results by work

    def product_round(self, case):
        device = self.device(case)
        server = self.servers[case]
        results = {}
        try:
            if case.uploads:
                device.measure("sync", "calendar")
                server.reset()
                results["uploads"] = device.measure("upload", case.uploads)
                self._note(results["uploads"], device, server)
                return results
            for work in case.works:
                if work == "one change":
                    server.touch(case.touched)
                server.reset()
                results[work] = device.measure("sync", case.kind)
                self._note(results[work], device, server)
            held = device.count(case.kind, case.table)
            if held != case.items:
                raise RuntimeError(f"{case.name}: the device holds {held} items")
            return results
        finally:
            device.close()

    @staticmethod
    def _note(result, device, server):
        counters = server.counters()
        result.update(peakKb=device.status("VmHWM"), requests=counters["requests"], connections=counters["connections"],
                      pagesMade=counters["pagesMade"])

    def floor_round(self, case):
        floor = self.floor(case)
        server = self.servers[case]
        results = {}
        try:
            for work in case.works:
                if work == "one change":
                    server.touch(case.touched)
                results[work] = (floor.measure("upload", "--count", str(case.uploads)) if case.uploads
                                 else floor.measure(case.kind))
            return results
        finally:
            floor.close()

    # --- flushes to disk, never in a timed run

    def product_flushes(self, case):
        device = self.device(case)
        results = {}
        try:
            if case.uploads:
                device.measure("sync", "calendar")
            for work in case.works:
                if work == "one change":
                    self.servers[case].touch(case.touched)
                trace = FlushTrace(device)
                device.measure("upload", case.uploads) if case.uploads else device.measure("sync", case.kind)
                results[work] = trace.end()
            return results
        finally:
            device.close()

    def floor_flushes(self, case):
        floor = self.floor(case)
        empty = self.floor(case)
        results = {}
        try:
            making = empty.flushes("upload", "--count", "0")  # of the two files
            opening = empty.flushes("upload", "--count", "0")
            for work in case.works:
                if work == "one change":
                    self.servers[case].touch(case.touched)
                total = (floor.flushes("upload", "--count", str(case.uploads)) if case.uploads
                         else floor.flushes(case.kind))
                results[work] = total - (making if work in ("first sync", "uploads") else opening)
            return results
        finally:
            floor.close()
            empty.close()
