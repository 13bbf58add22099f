"""The scenarios that are not a disturbance at a step."""

SCENARIOS = {}


def run(workers, table, arguments):
    """Those that `arguments` ask for, a row each."""
    for name, scenario in SCENARIOS.items():
        if arguments.scenario in (None, name):
            scenario(workers, table, arguments)
