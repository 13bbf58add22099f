"""A device of its own below a root folder: the tool, and the daemon, alone or under the tracer."""
import contextlib
import json
import os
import pathlib
import signal
import subprocess
import time

from faultlab import paths

SOCKET = "tmp/.vantor_pim_sync_ipc"
STORES = ("opt/usr/data/records/calendar.db", "opt/usr/data/records/contacts.db",
          "opt/usr/dbspace/.vantor_pim_sync_calendar.db", "opt/usr/dbspace/.vantor_pim_sync_todo.db",
          "opt/usr/dbspace/.vantor_pim_sync_contacts.db")


class ToolFailed(Exception):
    """The tool ended with another status than 0."""


class Device:
    def __init__(self, folder):
        self.root = pathlib.Path(folder) / "root"
        self.log_path = pathlib.Path(folder) / "daemon.log"
        self.report_path = pathlib.Path(folder) / "steps"
        self.wrapper = []  # a command that the daemon is started with
        self._daemon = None
        self._traced = False

    # --- the tool

    def run(self, *arguments, text=None, timeout=60):
        """Status and output; a tool that does not end in time is killed and has no status."""
        environment = dict(os.environ, VANTOR_PIM_SYNC_ROOT=str(self.root))
        try:
            done = subprocess.run([paths.binary("vantor-pim-syncctl"), *arguments], env=environment, timeout=timeout,
                                  input=text, capture_output=True, encoding="utf-8")
        except subprocess.TimeoutExpired:
            return None, "timeout"
        return done.returncode, done.stdout if done.returncode == 0 else done.stderr

    def tool(self, *arguments, text=None):
        status, output = self.run(*arguments, text=text)
        if status != 0:
            raise ToolFailed(f"{' '.join(arguments)}: {output.strip()}")
        return output.strip()

    def json(self, *arguments):
        return json.loads(self.tool(*arguments, "--json"))

    def initialize(self, provider):
        self.root.mkdir(parents=True)
        self.tool("init")
        self.tool("key", "set", "vantor.tovik.client.id", text=provider.ready["clientId"])
        self.tool("key", "set", "vantor.tovik.client.secret", text=provider.ready["clientSecret"])

    def add_account(self, provider, number=1, *more):
        account = provider.ready["accounts"][number - 1]
        self.tool("account", "add", "--id", str(number), "--email", account["email"], "--server", provider.url,
                  "--refresh-token-file", "-", *more, text=account["refreshToken"])

    def sync(self, number=1, kind="all", timeout=60):
        return self.run("sync", str(number), kind, "--wait", timeout=timeout)

    # --- the daemon

    def start(self, fault=None):
        """Alone, or with `fault` (options of the tracer; an empty list only counts). Waits until it answers or is gone."""
        (self.root / SOCKET).unlink(missing_ok=True)
        command = [*self.wrapper, paths.binary("vantor-pim-sync")]
        self._traced = fault is not None
        if self._traced:
            command = [paths.binary("faultpoint"), "--root", str(self.root), "--report", str(self.report_path), *fault,
                       "--", *command]
        with open(self.log_path, "ab") as log:
            self._daemon = subprocess.Popen(command, stderr=log, stdout=log, stdin=subprocess.DEVNULL,
                                            env=dict(os.environ, VANTOR_PIM_SYNC_ROOT=str(self.root)))
        end = time.monotonic() + 20
        while self.is_running() and not (self.root / SOCKET).exists() and time.monotonic() < end:
            time.sleep(0.002)

    def is_running(self):
        return self._daemon is not None and self._daemon.poll() is None

    def pid(self):
        if not self._traced:
            return self._daemon.pid
        return int(self.report()[0].split()[1])

    def report(self):
        return self.report_path.read_text().splitlines()

    def heal(self):
        """Ends the disturbance of a daemon that is traced."""
        self._daemon.send_signal(signal.SIGUSR1)

    def _signal(self, number):
        with contextlib.suppress(ProcessLookupError):  # ended a moment ago
            os.kill(self.pid(), number)

    def kill(self):
        if self.is_running():
            self._signal(signal.SIGKILL)
            self.wait_for_end()

    def stop(self, timeout=20):
        """Ends it as a service manager would; false when it had to be killed."""
        if not self.is_running():
            return True
        self._signal(signal.SIGTERM)
        return self.wait_for_end(timeout)

    def wait_for_end(self, timeout=20):
        try:
            self._daemon.wait(timeout)
            return True
        except subprocess.TimeoutExpired:
            self._signal(signal.SIGKILL)
            self._daemon.wait()
            return False

    def exit_status(self):
        return self._daemon.returncode

    def log(self):
        return self.log_path.read_text(errors="replace") if self.log_path.exists() else ""

    # --- the stores

    def store_contents(self):
        return {name: (self.root / name).read_bytes() for name in STORES if (self.root / name).exists()}
