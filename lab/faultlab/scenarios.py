"""The states that a trial begins with: what both sides hold, and what waits to be synced."""
import json
import pathlib
import pickle

from faultlab import account, paths
from faultlab.device import Device
from faultlab.history import History
from faultlab.provider import Provider

OTHER = {"calendar": "--no-contacts", "contacts": "--no-calendar"}


class Scenario:
    """`phase`: first (nothing was synced yet), compare (the server has changes), upload (the device has), both."""

    def __init__(self, phase, kind):
        self.phase, self.kind = phase, kind
        self.name = f"{phase}-{kind}"

    def prepare(self, folder, port):
        """Leaves in `folder` what a trial is a copy of."""
        folder = pathlib.Path(folder)
        folder.mkdir(parents=True)
        seed = folder / "provider.json"
        seed.write_text(json.dumps(account.SEED))
        device, history = Device(folder), History()
        with Provider(port, str(seed)) as provider:
            account.FILL[self.kind](provider, history)
            device.initialize(provider)
            provider.forget_requests()
            device.add_account(provider, 1, OTHER[self.kind])
            self._advance(provider, device, history)
            device.tool("daemon", "stop")
            if self.phase in ("compare", "both"):
                account.CHANGE_ON_SERVER[self.kind](provider, history)
            if self.phase in ("upload", "both"):
                account.CHANGE_ON_DEVICE[self.kind](device, history)
            seed.write_text(json.dumps(provider.admin("GET", "/dump")))
        (folder / "history").write_bytes(pickle.dumps(history))

    def _advance(self, provider, device, history):
        if self.phase == "first":
            if provider.requests():
                raise RuntimeError("the account was synced before it was asked for")
            return
        for _ in range(2):
            status, output = device.sync(1, self.kind)
            if status != 0:
                raise RuntimeError(f"{self.name}: {output}")


SCENARIOS = {s.name: s for s in (Scenario(phase, kind) for phase in ("first", "compare", "upload", "both")
                                 for kind in ("calendar", "contacts"))}


class Trial:
    """One copy of a prepared state, with its provider; a context."""

    def __init__(self, prepared, folder, port):
        paths.replace_folder(prepared, folder)
        self.folder = pathlib.Path(folder)
        self.history = pickle.loads((self.folder / "history").read_bytes())
        self.device = Device(folder)
        self.provider = Provider(port, str(self.folder / "provider.json"))

    def __enter__(self):
        self.provider.__enter__()
        return self

    def __exit__(self, *_):
        self.device.kill()
        self.provider.__exit__()
