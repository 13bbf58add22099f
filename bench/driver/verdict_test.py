"""What --quick fails on."""
import unittest

from cases import events
from main import quick_verdict

SMALL, LARGE = events(1000), events(5000)


def rounds(cpu_ms, peak_kb):
    return [{work: {"cpuMs": cpu_ms * noise, "peakKb": peak_kb} for work in SMALL.works} for noise in (1, 1.3, 2)]


class VerdictTest(unittest.TestCase):
    def test_cases(self):
        for name, large, expected in (
                ("the same cost an item", rounds(500, 25000), 0),
                ("cheaper", rounds(300, 25000), 0),
                ("a quarter more", rounds(625, 25000), 0),
                ("half as much again", rounds(750, 25000), len(SMALL.works)),
                ("quadratic", rounds(2500, 25000), len(SMALL.works)),
                ("memory by the item", rounds(500, 60000), len(SMALL.works)),
                ("both", rounds(2500, 60000), 2 * len(SMALL.works))):
            with self.subTest(name):
                self.assertEqual(len(quick_verdict({SMALL: rounds(100, 24000), LARGE: large})), expected)


if __name__ == "__main__":
    unittest.main()
