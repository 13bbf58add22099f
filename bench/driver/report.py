"""The tables, in Markdown."""
import os
import platform
import re
import statistics
import subprocess

KB_PER_MB = 1024
_load = ", ".join(f"{value:.1f}" for value in os.getloadavg())


def spread(values, digits=0):
    """Median (minimum-maximum)."""
    median, low, high = statistics.median(values), min(values), max(values)
    return f"{median:.{digits}f} ({low:.{digits}f}–{high:.{digits}f})"


def values(rounds, work, name):
    return [entry[work][name] for entry in rounds if work in entry]


def median(rounds, work, name):
    return statistics.median(values(rounds, work, name))


def _first_line(*command):
    try:
        done = subprocess.run(command, capture_output=True, text=True, check=False)
        return done.stdout.splitlines()[0] if done.stdout else "?"
    except OSError:
        return "?"


def _package(name):
    done = subprocess.run(["dpkg-query", "-W", "-f", "${Version}", name], capture_output=True, text=True, check=False)
    return f"{name} {done.stdout or '–'}"


def machine():
    with open("/proc/cpuinfo") as file:
        text = file.read()
    model = re.search(r"model name\s*: (.*)", text)
    with open("/proc/meminfo") as file:
        memory = int(re.search(r"MemTotal:\s+(\d+)", file.read()).group(1)) // KB_PER_MB
    packages = ["libcurl4", "libsqlite3-0", "libjson-glib-1.0-0", "libglib2.0-0", "vdirsyncer", "strace"]
    commit = _first_line("git", "log", "-1", "--format=%h %ad", "--date=short")
    return "\n".join([
        f"- machine: {model.group(1) if model else platform.machine()}, {text.count('processor	:')} processors, {memory} MB, "
        f"Linux {platform.release()}",
        "- load before the first run (others on the machine): " + _load,
        f"- compiler: {_first_line('g++', '--version')}, preset release (-O2)",
        "- libraries: " + ", ".join(_package(name) for name in packages),
        f"- commit: {commit}"])


def costs(cases, product, floor, flushes):
    lines = ["| size | work | wall ms | floor ms | ratio | of the best | CPU ms | floor CPU ms | CPU ratio | peak MB | requests | new connections "
             "| fsyncs | floor's |",
             "|" + "---|" * 14]
    for case in cases:
        for work in case.works:
            ours, least = product[case], floor[case]
            ratio = median(ours, work, "wallMs") / median(least, work, "wallMs")
            best = min(values(ours, work, "wallMs")) / min(values(least, work, "wallMs"))
            both = flushes.get(case)
            lines.append(" | ".join([
                f"| {case.name}", work, spread(values(ours, work, "wallMs")), spread(values(least, work, "wallMs")),
                f"{ratio:.2f}", f"{best:.2f}", f"{median(ours, work, 'cpuMs'):.0f}", f"{median(least, work, 'cpuMs'):.0f}",
                f"{median(ours, work, 'cpuMs') / median(least, work, 'cpuMs'):.2f}",
                f"{max(values(ours, work, 'peakKb')) / KB_PER_MB:.1f}", f"{median(ours, work, 'requests'):.0f}",
                f"{median(ours, work, 'connections'):.0f}", str(both[0][work]) if both else "–",
                f"{both[1][work]} |" if both else "– |"]))
    return "\n".join(lines)


def peers(cases, product, peer, start):
    lines = [f"Starting the peer's interpreter alone takes {start:.0f} ms; that is part of its times.", "",
             "| size | work | daemon ms | peer ms | as fast | peer CPU ms |", "|---|---|---|---|---|---|"]
    for case in cases:
        for work in ("first sync", "no changes"):
            ours, theirs = median(product[case], work, "wallMs"), median(peer[case], work, "wallMs")
            lines.append(f"| {case.name} | {work} | {ours:.0f} | {spread(values(peer[case], work, 'wallMs'))} "
                         f"| {theirs / ours:.1f} | {median(peer[case], work, 'cpuMs'):.0f} |")
    return "\n".join(lines)


def limits(rows):
    lines = ["| what | limit | measured | |", "|---|---|---|---|"]
    for what, measured, limit, unit, is_least in rows:
        holds = measured >= limit if is_least else measured <= limit
        lines.append(f"| {what} | {'at least' if is_least else 'at most'} {limit:g}{unit} | {measured:.2f}{unit} "
                     f"| {'holds' if holds else '**missed**'} |")
    return "\n".join(lines)
