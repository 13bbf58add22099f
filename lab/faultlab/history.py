"""What was written, on which side, with a text of its own: the other half of the claim's evidence."""
import re

# What the log calls the outcome of a change that lost against the other side's.
RULE = re.compile(r"(wins|is dropped|is not sent|taken over with the device's change)")


class History:
    """Texts that must be there once, and texts that must be gone. `uid` names the item in the daemon's log."""

    def __init__(self):
        self._writes = {}

    def wrote(self, text, uid=""):
        self._writes[text] = ("there", uid)

    def removed(self, text, uid=""):
        self._writes[text] = ("gone", uid)

    def may_be_lost(self, text):
        """Another write of the laboratory went over it, or was on its way to."""
        self._writes.pop(text, None)

    def texts(self, ending):
        """Of what must be there, the texts that end so."""
        return [text for text, (state, _) in self._writes.items() if state == "there" and text.endswith(ending)]

    def problems(self, side, items, log):
        problems = []
        for text, (state, uid) in self._writes.items():
            count = sum(1 for item in items if text in item)
            expected = 1 if state == "there" else 0
            if count == expected or self._is_explained(uid, log):
                continue
            problems.append(f"history: {text!r} of {uid or 'an item'} should be {state}, and is {count} times on the {side}")
        return problems

    @staticmethod
    def _is_explained(uid, log):
        return bool(uid) and any(uid in line and RULE.search(line) for line in log.splitlines())
