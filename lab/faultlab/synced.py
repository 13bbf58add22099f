"""A provider and a device with the laboratory's account, in step, and the daemon stopped: where longer trials begin."""
import contextlib
import json
from typing import NamedTuple

from faultlab import account
from faultlab.history import History
from faultlab.provider import Provider


class Synced(NamedTuple):
    device: object
    provider: object
    history: object


@contextlib.contextmanager
def synced(worker):
    device, history = worker.fresh_device(), History()
    seed = device.root.parent / "provider.json"
    seed.write_text(json.dumps(account.SEED))
    with Provider(worker.port, str(seed)) as provider:
        try:
            for fill in account.FILL.values():
                fill(provider, history)
            device.initialize(provider)
            device.add_account(provider)
            device.sync()
            device.tool("daemon", "stop")
            yield Synced(device, provider, history)
        finally:
            device.kill()
