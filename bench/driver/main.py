"""bench/run: the command line, and the order of the runs."""
import argparse
import os
import shlex
import statistics
import sys
import tempfile

import cases as catalogue
import idle
import peer
import report
from cases import Bench, contacts, events

# A quarter is what growth may be; the rest is what the same program differs by between two runs of a few.
GROWTH_LIMIT = 1.25
NOISE = 0.15
MEMORY_GROWTH_LIMIT = 1.5


def options():
    parser = argparse.ArgumentParser(
        prog="bench/run", formatter_class=argparse.RawDescriptionHelpFormatter,
        description="Measures the daemon beside the least that the same work can cost, and prints Markdown tables.",
        epilog="examples:\n  bench/run                 all sizes, five runs (about seven minutes)\n"
               "  bench/run --peer          also vdirsyncer with as many items\n"
               "  bench/run --quick         1,000 and 5,000 events, 2,000 contacts; exit 1 when the cost of an item grows")
    parser.add_argument("--runs", type=int, help="runs of each (default 5; with --quick 3)")
    parser.add_argument("--quick", action="store_true", help="few sizes and runs, a verdict as exit status")
    parser.add_argument("--peer", action="store_true", help="also measure vdirsyncer")
    parser.add_argument("--folder", default="/dev/shm", help="where the devices' files lie (default: in memory)")
    parser.add_argument("--disk-folder", default="/var/tmp", help="where they lie in the cases on a disk (default: /var/tmp)")
    parser.add_argument("--only", help="only cases whose name contains this")
    parser.add_argument("--no-idle", action="store_true", help="leave out the idle daemon (over a minute)")
    chosen = parser.parse_args()
    chosen.runs = chosen.runs or (3 if chosen.quick else 5)
    return chosen


def say(text):
    print(text, file=sys.stderr, flush=True)


def measure_rounds(bench, chosen, cases):
    """Interleaved: what the machine does meanwhile meets all of them alike."""
    product = {case: [] for case in cases}
    floor = {case: [] for case in cases}
    peers = {case: [] for case in cases if chosen.peer and peer.serves(case)}
    for number in range(chosen.runs):
        say(f"run {number + 1} of {chosen.runs}")
        for case in cases:
            sides = [lambda: product[case].append(bench.product_round(case)),
                     lambda: floor[case].append(bench.floor_round(case))]
            for side in sides if number % 2 == 0 else reversed(sides):
                side()
            if case in peers:
                peers[case].append(peer.round_of(bench, case))
    made = [entry["pagesMade"] for rounds in product.values() for works in rounds for entry in works.values()]
    if any(made):
        raise RuntimeError("pages were made within the measured time")
    return product, floor, peers


def measure_flushes(bench, cases):
    flushes = {}
    for case in cases:
        say(f"flushes of {case.name}")
        flushes[case] = (bench.product_flushes(case), bench.floor_flushes(case))
    return flushes


def growth(product, small, large, work, what, pick):
    """How much more an item costs in the larger case."""
    costs = [pick(report.values(product[case], work, what)) / case.items for case in (small, large)]
    return costs[1] / costs[0]


def limit_rows(product, floor, peers, idle_result):
    def ratio(case, work, over, what="wallMs"):
        return report.median(product[case], work, what) / report.median(over[case], work, what)

    def against_floor(case, work, limit):
        name = case.name if case.uploads else f"{work}, {case.name}"
        return [(f"{name}, against the floor", ratio(case, work, floor), limit, " times", False),
                (f"{name}, against the floor, processor time", ratio(case, work, floor, "cpuMs"), limit, " times", False)]

    five, two = events(5000), contacts(2000)
    small, large = events(1000), events(20000)
    rows = []
    for case, work, limit, faster in ((five, "first sync", 2, 1.5), (five, "no changes", 1.3, 4), (two, "first sync", 2.5, 1.5)):
        if case not in product:
            continue
        rows += against_floor(case, work, limit)
        if case in peers:
            rows.append((f"{work}, {case.name}, against the peer", 1 / ratio(case, work, peers), faster, " times as fast", True))
    for case in product:
        if case.uploads and not case.tls:
            rows += against_floor(case, "uploads", 1.5)
    if small in product and large in product:
        for work in ("first sync", "no changes"):
            for what, name in (("wallMs", "time"), ("cpuMs", "processor time")):
                rows.append((f"{name} of an item from 1,000 to 20,000 events, {work}",
                             growth(product, small, large, work, what, statistics.median), GROWTH_LIMIT, " times", False))
        peaks = {case: max(report.values(product[case], work, "peakKb")[-1] for work in case.works) for case in (small, large)}
        rows.append(("peak memory, 20,000 over 1,000 events", peaks[large] / peaks[small], MEMORY_GROWTH_LIMIT, " times", False))
        rows.append(("peak memory, 20,000 events", peaks[large] / report.KB_PER_MB, 48, " MB", False))
    if idle_result:
        for state in ("started", "synced"):
            memory = idle_result[state]
            rows += [(f"idle daemon, {state}, resident memory", memory["Rss"] / report.KB_PER_MB, 20, " MB", False),
                     (f"idle daemon, {state}, its share of it", memory["Pss"] / report.KB_PER_MB, 20, " MB", False)]
        rows += [("idle daemon, wakes a minute", idle_result["wakesPerMinute"], 1, "", False),
                 ("start to the first answer (slowest)", max(idle_result["firstAnswerMs"]), 50, " ms", False),
                 ("get_state, median", statistics.median(idle_result["stateUs"]), 200, " µs", False)]
    return rows


def quick_verdict(product):
    """What grows although it must not: in processor time and in the best run, which others on the machine disturb least."""
    small, large = events(1000), events(5000)
    problems = []
    for work in small.works:
        cost = growth(product, small, large, work, "cpuMs", min)
        if cost > GROWTH_LIMIT + NOISE:
            problems.append(f"{work}: an item of 5,000 events costs {cost:.2f} times one of 1,000")
        memory = (min(report.values(product[large], work, "peakKb")) / min(report.values(product[small], work, "peakKb")))
        if memory > MEMORY_GROWTH_LIMIT:
            problems.append(f"{work}: 5,000 events take {memory:.2f} times the memory of 1,000")
    return problems


def measure_all(bench, chosen, cases):
    product, floor, peers = measure_rounds(bench, chosen, cases)
    flushes = {} if chosen.quick else measure_flushes(bench, cases)
    idle_result = None
    if not (chosen.quick or chosen.no_idle) and events(5000) in cases:
        say("the idle daemon")
        idle_result = idle.measure(bench, events(5000), chosen.runs)
    print(f"`{shlex.join(['bench/run', *sys.argv[1:]])}`")
    print(f"\n{report.machine()}\n- {chosen.runs} interleaved runs, median (minimum–maximum); files in {chosen.folder}, "
          f"on a disk: in {chosen.disk_folder}\n")
    print(report.costs(cases, product, floor, flushes))
    if peers:
        print(f"\n{report.peers(list(peers), product, peers, peer.start_ms())}")
    rows = limit_rows(product, floor, peers, idle_result)
    if rows:
        print(f"\n{report.limits(rows)}")
    if idle_result:
        print(f"\nStart to first answer: {report.spread(idle_result['firstAnswerMs'], 1)} ms; get_state: "
              f"{report.spread(idle_result['stateUs'], 1)} µs, the 99th of a hundred {report.spread(idle_result['stateP99Us'], 1)} µs.")
    return product


def main():
    chosen = options()
    cases = [case for case in (catalogue.QUICK if chosen.quick else catalogue.ALL) if not chosen.only or chosen.only in case.name]
    if not cases:
        sys.exit("bench/run: no case has such a name")
    with (tempfile.TemporaryDirectory(prefix="vps-bench-", dir=chosen.folder) as folder,
          tempfile.TemporaryDirectory(prefix="vps-bench-", dir=chosen.disk_folder) as disk_folder):
        say("making pages")
        bench = Bench(folder, disk_folder, cases)
        try:
            product = measure_all(bench, chosen, cases)
        finally:
            bench.close()
    problems = quick_verdict(product) if chosen.quick and {events(1000), events(5000)} <= set(cases) else []
    for problem in problems:
        print(f"bench/run: {problem}", file=sys.stderr)
    sys.exit(1 if problems else 0)


if __name__ == "__main__":
    os.chdir(os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", ".."))
    main()
