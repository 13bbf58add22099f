"""Trials side by side: each worker has a folder in memory, a port of its own, and its own copy of the prepared states."""
import concurrent.futures
import functools
import os
import pathlib
import shutil
import tempfile
import traceback

from faultlab import paths, points
from faultlab.device import Device
from faultlab.provider import free_port
from faultlab.scenarios import SCENARIOS, Trial

_worker = None


class _Worker:
    def __init__(self, folder, keep):
        self.folder = pathlib.Path(folder) / str(os.getpid())
        self.port = free_port()
        self.keep = keep

    def trial(self, scenario):
        prepared = self.folder / "prepared" / scenario.name
        if not prepared.exists():
            scenario.prepare(prepared, self.port)
        return Trial(prepared, self.folder / "trial", self.port)

    def fresh_device(self):
        shutil.rmtree(self.folder / "trial", ignore_errors=True)
        (self.folder / "trial").mkdir(parents=True)
        return Device(self.folder / "trial")


def _begin(folder, keep):
    global _worker
    _worker = _Worker(folder, keep)


def _count(name):
    return points.count(_worker.trial(SCENARIOS[name]), SCENARIOS[name])


def _trial_at_step(worker, point):
    scenario = SCENARIOS[point.scenario]
    return points.run(worker.trial(scenario), scenario, point)


def _run(function, job):
    return function(_worker, job)


def _run_trial(function, job):
    try:
        outcome = function(_worker, job)
    except Exception as failure:  # a trial that broke is a trial that did not survive
        outcome = points.Outcome(job, "", [f"the trial broke: {failure!r}"], [traceback.format_exc()])
    if outcome.problems and _worker.keep:
        kept = _worker.folder.parent / job.folder()
        paths.replace_folder(_worker.folder / "trial", kept)
        outcome.notes.append(f"kept in {kept}")
    return outcome


class Pool:
    """A context; its folder goes with it unless something was kept."""

    def __init__(self, jobs, keep):
        self._keep = keep
        self._folder = tempfile.mkdtemp(prefix="vps-lab-", dir=paths.MEMORY)
        self._executor = concurrent.futures.ProcessPoolExecutor(jobs, initializer=_begin, initargs=(self._folder, keep))

    def __enter__(self):
        return self

    def __exit__(self, *_):
        self._executor.shutdown(cancel_futures=True)
        if not self._keep:
            shutil.rmtree(self._folder, ignore_errors=True)

    def count(self, name):
        return self._executor.submit(_count, name).result()

    def run(self, all_points):
        return self.trials(_trial_at_step, all_points)

    def trials(self, function, jobs):
        """The outcomes of `function(worker, job)`, in the jobs' order."""
        yield from self._executor.map(functools.partial(_run_trial, function), jobs)

    def each(self, function, jobs):
        """The results of `function(worker, job)`."""
        yield from self._executor.map(functools.partial(_run, function), jobs)
