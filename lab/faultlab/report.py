"""The table: scenario, thread, how many steps were tried, how many were survived; and how to replay what failed."""
import re
import sys
from collections import defaultdict

SHOWN_PROBLEMS = 3
SHOWN_TEXT = 260


def _shape(problem):
    """What failures have in common: texts and numbers are not."""
    return re.sub(r"'[^']*'|\d+|/\S+", "…", problem)[:90]


def _disturbance(action, length):
    if length:
        return f"{action}, {length} calls"
    return f"{action} until healed" if action in ("ENOSPC", "EIO") else action


class _Row:
    def __init__(self):
        self.tried = self.hit = self.survived = 0
        self.again = 0  # a sync failed although the disturbance was over
        self.last_hits = {}


class Table:
    def __init__(self):
        self._rows = defaultdict(_Row)
        self._failed = []

    def add(self, key, outcome):
        row = self._rows[key]
        row.tried += 1
        row.hit += bool(outcome.hit)
        row.survived += not outcome.problems
        row.again += outcome.failed_syncs > 0
        row.last_hits[outcome.point] = bool(outcome.hit)
        if outcome.problems:
            self._failed.append(outcome)
            print(f"FAILED {outcome.point.replay()}", file=sys.stderr)
            for problem in outcome.problems[:SHOWN_PROBLEMS]:
                print(f"    {problem[:SHOWN_TEXT]}", file=sys.stderr, flush=True)
            for note in outcome.notes:
                if note.startswith("kept in"):
                    print(f"    {note}", file=sys.stderr, flush=True)

    def was_hit(self, key, point):
        return self._rows[key].last_hits.get(point, False)

    def has_failures(self):
        return bool(self._failed) or not self._rows

    def show(self, seconds):
        print("| scenario | thread | disturbance | tried | met | survived | a sync failed after it |")
        print("|---|---|---|---|---|---|---|")
        total = _Row()
        for (name, thread, action, length), row in self._rows.items():
            print(f"| {name} | {thread} | {_disturbance(action, length)} "
                  f"| {row.tried} | {row.hit} | {row.survived} | {row.again} |")
            total.tried += row.tried
            total.hit += row.hit
            total.survived += row.survived
            total.again += row.again
        print(f"| all | | | {total.tried} | {total.hit} | {total.survived} | {total.again} |")
        print(f"\n{seconds / 60:.1f} minutes.")
        self._show_shapes()

    def _show_shapes(self):
        shapes = defaultdict(list)
        for outcome in self._failed:
            shapes[_shape(outcome.problems[0])].append(outcome.point)
        if shapes:
            print("\nWhat failed:")
        for shape, points in sorted(shapes.items(), key=lambda item: -len(item[1])):
            print(f"  {len(points)} times: {shape}\n      {points[0].replay()}")
