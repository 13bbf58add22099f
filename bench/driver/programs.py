"""The programs that are measured and what they are asked to do. Everything that is started here is ended here."""
import contextlib
import json
import os
import re
import shutil
import signal
import sqlite3
import ssl
import subprocess
import time
import urllib.request

BIN = os.path.abspath(os.path.join(os.path.dirname(__file__), "..", "..", "build", "release", "bin"))
EMAIL = "bench@provider.example"


def program(name):
    return os.path.join(BIN, name)


def run(arguments, env=None, text=None, timeout=900):
    """Standard output; an error with what the program said when it failed."""
    done = subprocess.run(arguments, env=env, input=text, capture_output=True, text=True, timeout=timeout)
    if done.returncode != 0:
        raise RuntimeError(f"{' '.join(arguments)}: {done.returncode}\n{done.stdout}{done.stderr}")
    return done.stdout


class PageServer:
    def __init__(self, events=0, contacts=0, tasks=0, tls=False):
        arguments = [program("bench-page-server"), "--events", str(events), "--contacts", str(contacts), "--tasks", str(tasks)]
        self.process = subprocess.Popen(arguments + (["--tls"] if tls else []), stdout=subprocess.PIPE, text=True)
        line = self.process.stdout.readline()
        if not line:
            raise RuntimeError("the page server did not start")
        self.ready = json.loads(line)
        self.url = self.ready["url"]
        self._context = ssl._create_unverified_context() if tls else None

    def _control(self, method, path):
        request = urllib.request.Request(f"{self.url}/bench/{path}", method=method)
        with urllib.request.urlopen(request, context=self._context, timeout=600) as reply:
            return json.loads(reply.read())

    def counters(self):
        return self._control("GET", "counters")

    def reset(self):
        self._control("POST", "reset")

    def touch(self, kind):
        self._control("POST", f"touch?kind={kind}")

    def close(self):
        self.process.kill()
        self.process.wait()


class Device:
    """One private root with one account, and the daemon that serves it."""

    def __init__(self, folder, server, contacts=False):
        self.folder = folder
        self.process = None
        os.makedirs(folder)
        self.env = dict(os.environ, VANTOR_PIM_SYNC_ROOT=folder)
        self.tool("init")
        self.tool("key", "set", "vantor.tovik.client.id", text=server.ready["clientId"])
        self.tool("key", "set", "vantor.tovik.client.secret", text=server.ready["clientSecret"])
        self.tool("account", "add", "--id", "1", "--email", EMAIL, "--server", server.url,
                  "--no-calendar" if contacts else "--no-contacts",
                  "--contacts" if contacts else "--calendar", "--calendar-period", "0", "--contacts-period", "0",
                  "--refresh-token-file", "-", text=server.ready["accounts"][0]["refreshToken"])
        self.stop()
        self.start()

    def start(self):
        """In this session, where the floor runs as well: the kernel shares the processor out between sessions first, so a
        daemon that the tool started in one of its own would meet the machine's other work differently."""
        self.process = subprocess.Popen([program("vantor-pim-sync")], env=self.env, stdin=subprocess.DEVNULL,
                                        stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        deadline = time.monotonic() + 20
        while subprocess.run([program("vantor-pim-syncctl"), "daemon", "status"], env=self.env, capture_output=True).returncode:
            if time.monotonic() > deadline or self.process.poll() is not None:
                raise RuntimeError("the daemon does not start")
            time.sleep(0.02)

    def tool(self, *arguments, text=None):
        return run([program("vantor-pim-syncctl"), *arguments], self.env, text)

    def measure(self, *arguments):
        return json.loads(run([program("bench-device"), *map(str, arguments)], self.env))

    def pid(self):
        return json.loads(self.tool("daemon", "status", "--json"))["pid"]

    def status(self, name):
        """A member of /proc/PID/status in kB."""
        with open(f"/proc/{self.pid()}/status") as file:
            return int(re.search(rf"^{name}:\s+(\d+)", file.read(), re.M).group(1))

    def memory(self):
        """What is resident, in kB: "Rss" with all of every page, "Pss" with its share of those that other processes map as well."""
        with open(f"/proc/{self.pid()}/smaps_rollup") as file:
            return {name: int(size) for name, size in re.findall(r"^(Rss|Pss):\s+(\d+)", file.read(), re.M)}

    def count(self, store, table):
        """Records of the device's store."""
        path = f"{self.folder}/opt/usr/data/records/{store}.db"
        with contextlib.closing(sqlite3.connect(f"file:{path}?mode=ro", uri=True)) as database:
            return database.execute(f"SELECT count(*) FROM {table}").fetchone()[0]

    def stop(self):
        self.tool("daemon", "stop")
        self._reap()

    def _reap(self):
        if self.process is not None:
            self.process.wait(timeout=60)
            self.process = None

    def close(self):
        subprocess.run([program("vantor-pim-syncctl"), "daemon", "stop"], env=self.env, capture_output=True)
        self._reap()
        shutil.rmtree(self.folder, ignore_errors=True)


class Floor:
    def __init__(self, folder, server):
        self.folder = folder
        self.server = server
        os.makedirs(folder)

    def measure(self, work, *more):
        return json.loads(run([program("bench-floor"), "--url", self.server.url, "--folder", self.folder, work, *more]))

    def flushes(self, work, *more):
        """fsync and fdatasync calls of the process, opening the files included."""
        out = self.folder + ".strace"
        run(["strace", "-f", "-c", "-e", "trace=fsync,fdatasync", "-o", out, program("bench-floor"), "--url",
             self.server.url, "--folder", self.folder, work, *more])
        return counted_flushes(out)

    def close(self):
        shutil.rmtree(self.folder, ignore_errors=True)


def counted_flushes(path):
    total = 0
    with open(path) as file:
        for line in file:
            columns = line.split()
            if columns and columns[-1] in ("fsync", "fdatasync"):
                total += int(columns[3])
    os.unlink(path)
    return total


class FlushTrace:
    """Counts the fsync and fdatasync calls of a running daemon while it is open."""

    def __init__(self, device):
        self.out = device.folder + ".strace"
        self.pid = device.pid()
        self.process = subprocess.Popen(
            ["strace", "-f", "-c", "-e", "trace=fsync,fdatasync", "-o", self.out, "-p", str(self.pid)],
            stderr=subprocess.DEVNULL)
        deadline = time.monotonic() + 20
        while not all(self._is_traced(task) for task in os.listdir(f"/proc/{self.pid}/task")):
            if time.monotonic() > deadline:
                raise RuntimeError("strace does not attach")
            time.sleep(0.02)

    def _is_traced(self, task):
        with open(f"/proc/{self.pid}/task/{task}/status") as file:
            return "TracerPid:\t0\n" not in file.read()

    def end(self):
        self.process.send_signal(signal.SIGINT)
        self.process.wait(timeout=60)
        return counted_flushes(self.out)
