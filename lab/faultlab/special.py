"""The scenarios that are not a disturbance at a step."""
from faultlab import accounts, long_run, random_kills, replies

SCENARIOS = {"replies": replies.run, "accounts": accounts.run, "random-kills": random_kills.run,
             "long-run": long_run.run}


def run(workers, table, arguments):
    """Those that `arguments` ask for."""
    for name, scenario in SCENARIOS.items():
        if arguments.scenario in (None, name):
            scenario(workers, table, arguments)
