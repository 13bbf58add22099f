"""A provider on this machine, driven through its admin services."""
import http.client
import json
import random
import socket
import subprocess
import urllib.parse

from faultlab import paths


def free_port():
    """Below the range that the kernel gives to outgoing connections, so that it stays free between two providers."""
    while True:
        port = random.SystemRandom().randrange(15000, 32000)  # workers share their seed
        with socket.socket() as probe:
            try:
                probe.bind(("127.0.0.1", port))
                return port
            except OSError:
                continue


def quoted(text):
    return urllib.parse.quote(text, safe="")


class Refused(Exception):
    """The admin services said no."""


class Provider:
    """Starts with the content of a dump; ends with the block that it is used in."""

    def __init__(self, port, dump_file):
        self.port = port
        self._dump_file = dump_file

    def __enter__(self):
        self._log = open(f"{self._dump_file}.requests", "a")
        self._process = subprocess.Popen(
            [paths.binary("vantor-pim-provider"), "--port", str(self.port), "--seed", self._dump_file],
            stdout=subprocess.PIPE, stderr=self._log)
        line = self._process.stdout.readline()
        if not line:
            raise RuntimeError(f"the provider did not start on port {self.port}")
        self.ready = json.loads(line)
        return self

    def __exit__(self, *_):
        self._process.terminate()
        self._process.wait()
        self._process.stdout.close()
        self._log.close()

    @property
    def url(self):
        return self.ready["url"]

    def _exchange(self, method, path, body, content_type):
        connection = http.client.HTTPConnection("127.0.0.1", self.port, timeout=30)
        try:
            connection.request(method, "/admin" + path, body=body,
                               headers={"Content-Type": content_type} if body is not None else {})
            reply = connection.getresponse()
            content = reply.read()
        finally:
            connection.close()
        if reply.status >= 300:
            raise Refused(f"{method} {path}: {reply.status} {content[:300]!r}")
        return content

    def admin(self, method, path, body=None):
        if method == "POST" and body is None:
            body = {}
        text = json.dumps(body).encode() if body is not None else None
        content = self._exchange(method, path, text, "application/json")
        return json.loads(content) if content else None

    def bytes(self, path):
        return self._exchange("GET", path, None, "")

    def put_bytes(self, path, content):
        self._exchange("PUT", path, content, "image/png")

    # --- what there is

    def calendars(self, email):
        return self.admin("GET", f"/accounts/{quoted(email)}/calendars")["calendars"]

    def events(self, calendar):
        return self.admin("GET", f"/calendars/{quoted(calendar)}/events")["items"]

    def task_lists(self, email):
        return self.admin("GET", f"/accounts/{quoted(email)}/tasklists")["items"]

    def tasks(self, email, task_list):
        return self.admin("GET", tasks_path(email, task_list))["items"]

    def people(self, email, kind):
        """Contacts or groups, without those that are marked as deleted."""
        items = self.admin("GET", people_path(email, kind))["items"]
        return [entry for entry in items if not entry.get("deleted")]

    def photo(self, email, contact):
        return self.bytes(f"{people_path(email, 'contacts')}/{contact}/photo")

    # --- what it was asked

    def forget_requests(self):
        self.admin("DELETE", "/requests")

    def requests(self):
        return self.admin("GET", "/requests")["requests"]

    def writes(self):
        return [f"{r['method']} {r['path']}" for r in self.requests()
                if r["method"] != "GET" and not r["path"].startswith("/o/oauth2/token")]


def events_path(calendar):
    return f"/calendars/{quoted(calendar)}/events"


def tasks_path(email, task_list):
    return f"/accounts/{quoted(email)}/tasklists/{quoted(task_list)}/tasks"


def people_path(email, kind):
    return f"/accounts/{quoted(email)}/{kind}"
