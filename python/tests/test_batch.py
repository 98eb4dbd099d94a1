"""kel.batch: rows for all pairs, once each, whatever is killed, cut or unreadable."""

import csv
import json
import os
import re
import signal
import subprocess
import sys
import time

import numpy as np
import pytest

import kel

pytest.importorskip("distributed")
COMMAND = [sys.executable, "-m", "kel.batch"]


@pytest.fixture(scope="module")
def survey(tmp_path_factory):
    """Eight shifted views of one scene, each pair of them, a file that is no picture, and one that is missing."""
    folder = tmp_path_factory.mktemp("survey")
    random = np.random.default_rng(5)
    scene = kel.gaussian(kel.gaussian(np.repeat(np.repeat(random.integers(0, 256, (40, 40), np.uint8), 12, 0), 12, 1)))
    for i in range(8):
        kel.write(folder / f"p{i}.png", scene[10 * i:10 * i + 300, 8 * i:8 * i + 360])
    (folder / "broken.png").write_bytes((folder / "p0.png").read_bytes()[:500])
    pairs = [(f"p{i}.png", f"p{j}.png", f"{i}<{j}, \"ü\"") for i in range(8) for j in range(8) if i != j]
    pairs += [("p1.png", "broken.png", "broken"), ("missing.png", "p1.png", "missing")]
    with open(folder / "pairs.csv", "w", newline="", encoding="utf-8") as file:
        csv.writer(file).writerows([("first", "second", "id"), *pairs])
    return folder


def rows(output):
    with open(output / "results.csv", newline="", encoding="utf-8") as file:
        return list(csv.DictReader(file))


def check(output, message):
    found = {row["id"]: row for row in rows(output)}
    assert len(found) == len(rows(output)) == 58, message
    assert sorted(name for name, row in found.items() if row["found"] == "0") == ["broken", "missing"]
    assert "broken.png" in found["broken"]["reason"] and "missing.png" in found["missing"]["reason"]
    H = [float(found['2<5, "ü"'][f"h{r}{c}"]) for r in (1, 2, 3) for c in (1, 2, 3)]
    np.testing.assert_allclose(np.reshape(H, (3, 3)), [[1, 0, -24], [0, 1, -30], [0, 0, 1]], atol=0.02 * 24)
    page = (output / "index.html").read_text(encoding="utf-8")
    assert page.count("<tr>") == 59 and page.count("<img") == 56 and "2&lt;5, &quot;ü&quot;" in page and "//" not in page
    assert all((output / picture).exists() for picture in re.findall('src="([^"]*)"', page))


def start(survey, output, *more):
    return subprocess.Popen([*COMMAND, survey / "pairs.csv", "--output", output, "--batch", "2", *more], stderr=subprocess.PIPE, text=True,
                            stdout=subprocess.DEVNULL)


def finished(run):
    """What a run that succeeds says."""
    message = run.communicate()[1]
    assert run.returncode == 0, message
    return message


def wait_for(condition, process):
    end = time.monotonic() + 60
    while not condition():
        assert time.monotonic() < end
        assert process.poll() is None, process.stderr and process.stderr.read()
        time.sleep(0.02)


def test_killed(survey, tmp_path):
    """A worker, and then the run itself, are killed; what the crash cut is done again, what was there stays."""
    output = tmp_path / "out"
    run = start(survey, output, "--workers", "2")
    lines = lambda: (output / "results.csv").read_bytes().count(b"\n") if (output / "results.csv").exists() else 0
    wait_for(lambda: lines() > 6, run)
    workers = subprocess.run(["ps", "-o", "pid=,args=", "--ppid", str(run.pid)], capture_output=True, text=True).stdout
    os.kill(int(re.search(r"(\d+) .*spawn_main", workers).group(1)), signal.SIGKILL)
    before = lines()
    wait_for(lambda: lines() > min(before + 8, 40), run)
    second = start(survey, output)
    assert second.wait() == 1 and "another run" in second.stderr.read()
    run.kill()
    run.wait()
    early = (output / "results.csv").read_bytes()
    assert early.count(b"\n") < 59
    with open(output / "results.csv", "ab") as file:
        file.write(b"half a r")
    message = finished(start(survey, output, "--workers", "1"))
    assert f"{early.count(10) - 1} of 58 pairs are there already" in message
    assert (output / "results.csv").read_bytes().startswith(early)
    check(output, message)
    assert "58 of 58" in finished(start(survey, output))  # nothing is left: no cluster, the same page
    check(output, "")


def test_cluster(survey, tmp_path):
    """On a cluster that is there; its two workers read each picture once, unless memory is short, with the same results."""
    from distributed import LocalCluster

    with LocalCluster(n_workers=2, threads_per_worker=1, processes=True, dashboard_address=None) as cluster:
        counts, numbers = [], []
        for memory in ("2", "500"):
            message = finished(start(survey, tmp_path / memory, "--scheduler", cluster.scheduler_address, "--memory", memory))
            check(tmp_path / memory, message)
            counts.append(int(re.search(r"10 pictures, read (\d+) times", message).group(1)))
            numbers.append({row["id"]: row["h13"] for row in rows(tmp_path / memory)})
    assert counts[0] > 10 == counts[1]
    assert numbers[0] == numbers[1]


def test_scheduler_killed(survey, tmp_path):
    """A cluster's scheduler is killed: the run says so in one line, and the next one goes on from there without a cluster."""
    file, module = tmp_path / "scheduler.json", [sys.executable, "-m", "distributed.cli.dask_"]
    quiet = {"stdout": subprocess.DEVNULL, "stderr": subprocess.DEVNULL}
    start_one = lambda kind, *more: subprocess.Popen([*module[:2], module[2] + kind, "--scheduler-file", str(file), "--no-dashboard", *more],
                                                     cwd=tmp_path, **quiet)
    scheduler, worker = start_one("scheduler", "--port", "0", "--host", "127.0.0.1"), start_one("worker", "--nthreads", "1", "--no-nanny")
    try:
        wait_for(file.exists, scheduler)
        run = start(survey, tmp_path / "out", "--scheduler", json.loads(file.read_text())["address"])
        lines = lambda: len(rows(tmp_path / "out")) if (tmp_path / "out" / "results.csv").exists() else 0
        wait_for(lambda: lines() > 4, run)
        scheduler.kill()
        message = run.communicate(timeout=120)[1]
    finally:
        for process in (scheduler, worker):
            process.kill()
            process.wait()
    assert run.returncode == 1 and message.rstrip().splitlines()[-1].endswith("run the same again, and it goes on from here")
    assert "Traceback" not in message and 4 < lines() < 58
    message = finished(start(survey, tmp_path / "out", "--workers", "1"))
    assert "of 58 pairs are there already" in message
    check(tmp_path / "out", message)


def test_refused(survey, tmp_path):
    def refused(content, *more):
        pairs = tmp_path / "pairs.csv"
        pairs.write_text(content)
        run = subprocess.run([*COMMAND, pairs, "--output", tmp_path / "out", *more], capture_output=True, text=True)
        assert run.returncode and "Traceback" not in run.stderr
        return run.stderr

    assert "no column 'second'" in refused("first,third\na,b\n")
    assert "there twice" in refused("first,second,id\na,b,1\na,c,1\n")
    assert "pair 2 is not complete" in refused("first,second\na,b\na\n")
    assert "1 to 1000" in refused("first,second\n", "--workers", "0")
    assert "127.0.0.1:9" in refused("first,second\na,b\n", "--scheduler", "tcp://127.0.0.1:9")
    (tmp_path / "out" / "results.csv").write_text("something,else\n")
    assert "no file of kel.batch" in refused("first,second\na,b\n")
    assert (tmp_path / "out" / "results.csv").read_text() == "something,else\n"
