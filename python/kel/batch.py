"""Registers many pairs of pictures: python3 -m kel.batch PAIRS.csv --output DIR.

On all cores of this machine, or on a cluster of Dask's that is there already. results.csv in DIR grows a batch of pairs at a time, so
that a run that was broken off goes on where it stopped; index.html shows it.
"""

import argparse
import collections
import contextlib
import csv
import fcntl
import hashlib
import html
import io
import logging
import os
import sys
import tempfile
import time
import uuid
import zlib
from typing import Any, Dict, List, NamedTuple, Optional, Sequence, Set, Tuple

import numpy as np

import kel

HEADER = ["id", "found", *(f"h{r}{c}" for r in (1, 2, 3) for c in (1, 2, 3)), "agreement", "inliers", "milliseconds", "reason"]
THUMBNAIL = 160  # pixels of the longer side


Row = Tuple[List[str], bytes]  # of results.csv, and a small picture


class Pair(NamedTuple):
    id: str
    first: str
    second: str


class Settings(NamedTuple):
    threshold: float
    features: int
    working_size: int
    memory: int  # bytes of pictures that a worker is given to keep


class Picture(NamedTuple):
    """A picture as workers keep it and hand it to each other: made ready once, with a small copy, or the reason why it is none."""

    prepared: Any  # kel.Prepared, or None
    small: Any
    scale: float  # of the small copy
    reason: str
    size: int  # bytes, about
    made: Tuple[str, str]  # by which worker, and a mark to tell apart what was made of the same file


class Outcome(NamedTuple):
    """What a task gives back."""

    rows: List[Row]
    worker: str
    pictures: Dict[str, Tuple[int, Tuple[str, str]]]  # size and made of each


# ---- What runs in a worker --------------------------------------------------------------------------------------------------

def load_picture(path: str, settings: Settings) -> Picture:
    from distributed import get_worker

    made = get_worker().address, uuid.uuid4().hex
    try:
        image = kel.read(path)
        prepared = kel.prepare(image, settings.features, settings.working_size)
        if image.dtype == np.int16:
            image = kel.convert(image, "GREY16", "GREY")
        if image.ndim == 3:
            image = kel.convert(image, "RGB" if image.shape[2] == 3 else "RGBA", "GREY")
        height, width = image.shape
        scale = min(1.0, THUMBNAIL / max(height, width))
        small = kel.resize(image, (max(1, round(width * scale)), max(1, round(height * scale))))
        worked = min(width * height, settings.working_size * settings.working_size)
        return Picture(prepared, small, scale, "", 2 * worked + 3 * width * height // 2 + 200 * settings.features, made)
    except Exception as error:  # whatever a file may lead to is a reason, and not the end of the run
        return Picture(None, None, 1.0, f"{path}: {error or type(error).__name__}", 1000, made)


def _small(first: Picture, second: Picture, homography: Any) -> bytes:
    """The first picture laid over the second one, or beside it without a homography, as a JPEG."""
    from PIL import Image

    if homography is None:
        height = max(first.small.shape[0], second.small.shape[0])
        both = np.hstack([np.pad(p.small, ((0, height - p.small.shape[0]), (0, 0))) for p in (first, second)])
    else:
        down, up = np.diag([second.scale, second.scale, 1]), np.diag([1 / first.scale, 1 / first.scale, 1])
        size = second.small.shape[::-1]
        try:
            laid = kel.warp(first.small, down @ homography @ up, size)
        except ValueError:
            laid = second.small
        both = np.dstack([laid, second.small, second.small])  # what differs is coloured
    file = io.BytesIO()
    Image.fromarray(np.ascontiguousarray(both)).save(file, "JPEG", quality=70)
    return file.getvalue()


def register_batch(pairs: Sequence[Pair], paths: Sequence[str], pictures: Sequence[Picture], settings: Settings) -> Outcome:
    """A row of results.csv and a small picture for each pair, from the pictures of `paths`."""
    from distributed import get_worker

    of = dict(zip(paths, pictures))
    rows = []
    for pair in pairs:
        start = time.perf_counter()
        first, second = of[pair.first], of[pair.second]
        numbers, agreement, inliers, reason, shown = [""] * 9, "", "", first.reason or second.reason, b""
        if not reason:
            kel.seed(zlib.crc32(pair.id.encode()))  # the same result wherever and whenever it is computed
            homography = None
            try:
                found = kel.register(first.prepared, second.prepared, settings.threshold, settings.features, settings.working_size)
                homography = found.homography
                numbers = [f"{value:.9g}" for value in homography.flat]
                agreement, inliers = f"{found.agreement:.4f}", str(found.inliers)
            except kel.NotRegistered as error:
                reason = error.reason
            shown = _small(first, second, homography)
        milliseconds = f"{1000 * (time.perf_counter() - start):.1f}"
        rows.append(([pair.id, str(int(not reason)), *numbers, agreement, inliers, milliseconds, " ".join(reason.split())], shown))
    return Outcome(rows, get_worker().address, {path: (picture.size, picture.made) for path, picture in of.items()})


def _version() -> str:
    return kel.__version__


# ---- Files ------------------------------------------------------------------------------------------------------------------


class Refused(Exception):
    """What the user has to mend; the message says it."""


def read_pairs(path: str) -> List[Pair]:
    """The pairs of a file with columns first, second and, perhaps, id. Pictures are named from the folder of the file."""
    folder = os.path.dirname(os.path.abspath(path))
    pairs, seen = [], set()
    try:
        with open(path, newline="", encoding="utf-8-sig") as file:
            table = csv.DictReader(file)
            for column in ("first", "second"):
                if column not in (table.fieldnames or []):
                    raise Refused(f"{path}: there is no column '{column}'")
            for number, row in enumerate(table, 1):
                name = row["id"] if "id" in row else str(number)
                if not name or not row["first"] or not row["second"]:
                    raise Refused(f"{path}: pair {number} is not complete")
                if name in seen or not name.isprintable():
                    raise Refused(f"{path}: the id of pair {number}, {name!r}, is {'there twice' if name in seen else 'not printable'}")
                seen.add(name)
                pairs.append(Pair(name, os.path.join(folder, row["first"]), os.path.join(folder, row["second"])))
    except (OSError, UnicodeDecodeError, csv.Error) as error:
        raise Refused(f"{path}: {error}") from error
    return pairs


class Results:
    """results.csv and the small pictures beside it. Only whole rows count; whoever has them open keeps others out."""

    def __init__(self, folder: str) -> None:
        try:
            os.makedirs(os.path.join(folder, "pictures"), exist_ok=True)
            self.folder, self.path = folder, os.path.join(folder, "results.csv")
            self.file = open(self.path, "a+b")
            fcntl.flock(self.file, fcntl.LOCK_EX | fcntl.LOCK_NB)
        except BlockingIOError as error:
            raise Refused(f"{self.path}: another run is at it") from error
        except OSError as error:
            raise Refused(f"{folder}: {error}") from error
        self.file.seek(0)
        content = self.file.read()
        whole = content[:content.rfind(b"\n") + 1]
        rows = list(csv.reader(io.StringIO(whole.decode("utf-8", "replace"), newline="")))
        if rows and (rows[0] != HEADER or any(len(row) != len(HEADER) for row in rows)):
            raise Refused(f"{self.path}: this is no file of kel.batch's")
        if not rows and content.strip(b"\0") and not ",".join(HEADER).encode().startswith(content):
            raise Refused(f"{self.path}: this is no file of kel.batch's")
        self.file.truncate(len(whole))  # a row that a crash cut
        self.rows = rows[1:]
        if not rows:
            self._append([HEADER])

    def _append(self, rows: Sequence[List[str]]) -> None:
        text = io.StringIO(newline="")
        csv.writer(text, lineterminator="\n").writerows(rows)
        self.file.write(text.getvalue().encode())
        self.file.flush()
        os.fsync(self.file.fileno())

    def add(self, rows: Sequence[Row]) -> None:
        try:
            for row, shown in rows:
                if shown:
                    with open(os.path.join(self.folder, picture_of(row[0])), "wb") as file:
                        file.write(shown)
            self._append([row for row, _ in rows])
        except OSError as error:
            raise Refused(f"{self.folder}: {error}; run the same again, and it goes on from here") from error
        self.rows.extend(row for row, _ in rows)


def picture_of(name: str) -> str:
    return f"pictures/{hashlib.sha256(name.encode()).hexdigest()[:24]}.jpg"


PAGE = """<!DOCTYPE html><html lang="en"><meta charset="utf-8"><title>Registrations</title>
<style>body{font:14px sans-serif;margin:2em}table{border-collapse:collapse}td,th{padding:3px 10px;border-bottom:1px solid #ddd;
text-align:left}th{cursor:pointer;background:#eee;position:sticky;top:0}img{max-height:120px}rect{fill:#47a}</style>
<h1>%(found)d of %(all)d pairs registered</h1>
<figure><svg width="460" height="150" role="img">%(bars)s</svg><figcaption>Pairs by agreement, 0 to 1</figcaption></figure>
<table><thead><tr><th>id<th>found<th>agreement<th>inliers<th>milliseconds<th>reason<th>pictures</tr></thead><tbody>
%(rows)s
</tbody></table>
<script>
for (const [i, head] of [...document.querySelectorAll("th")].entries()) head.onclick = () => {
  const body = document.querySelector("tbody"), up = head.dataset.up = head.dataset.up === "1" ? "0" : "1";
  const of = row => row.cells[i].textContent, compare = (a, b) => {
    if (a === "" || b === "") return (a === "") - (b === "");
    return (isNaN(a) || isNaN(b) ? a.localeCompare(b) : a - b) * (up === "1" ? 1 : -1); };
  body.append(...[...body.rows].sort((a, b) => compare(of(a), of(b)))); };
</script></html>
"""


def write_page(results: Results) -> None:
    """index.html: a table that sorts itself, a histogram, small pictures; nothing in it comes from elsewhere."""
    bins = [0] * 20
    rows = []
    for row in results.rows:
        values = dict(zip(HEADER, row))
        if values["agreement"]:
            bins[min(19, int(float(values["agreement"]) * 20))] += 1
        picture = picture_of(row[0])
        shown = f'<img loading="lazy" alt="" src="{picture}">' if os.path.exists(os.path.join(results.folder, picture)) else ""
        cells = (html.escape(values[name]) for name in ("id", "found", "agreement", "inliers", "milliseconds", "reason"))
        rows.append("<tr>" + "".join(f"<td>{cell}</td>" for cell in cells) + f"<td>{shown}</td></tr>")
    highest = max(1, *bins)
    bars = "".join(f'<rect x="{20 + 21 * i}" y="{130 - 120 * n / highest:.1f}" width="19" height="{120 * n / highest:.1f}">'
                   f"<title>{i / 20:.2f} to {(i + 1) / 20:.2f}: {n}</title></rect>" for i, n in enumerate(bins))
    bars += "".join(f'<text x="{20 + 420 * i}" y="147" text-anchor="middle">{i}</text>' for i in (0, 0.5, 1))
    page = PAGE % {"found": sum(row[1] == "1" for row in results.rows), "all": len(rows), "bars": bars, "rows": "\n".join(rows)}
    file = tempfile.NamedTemporaryFile("w", dir=results.folder, delete=False, encoding="utf-8")
    try:
        with file:
            file.write(page)
        os.chmod(file.name, 0o644)
        os.replace(file.name, os.path.join(results.folder, "index.html"))
    except OSError:
        os.unlink(file.name)
        raise


# ---- The run ----------------------------------------------------------------------------------------------------------------


class Bar:
    """How far it is, on standard error: one line that is written over on a terminal, a few lines elsewhere."""

    def __init__(self, done: int, of: int) -> None:
        self.before, self.of, self.start, self.last = done, of, time.monotonic(), -1.0

    def show(self, done: int, found: int, end: bool = False) -> None:
        now, live = time.monotonic(), sys.stderr.isatty()
        if not end and now - self.last < (0.2 if live else 10):
            return
        self.last = now
        rate = (done - self.before) / max(1e-9, now - self.start)
        filled = 30 * done // max(1, self.of)
        line = f"[{'#' * filled}{'.' * (30 - filled)}] {done} of {self.of} pairs, {found} registered, {rate:.1f} a second"
        print(("\r\033[K" if live else "") + line, end="\n" if end or not live else "", file=sys.stderr, flush=True)


def connect(arguments: argparse.Namespace, folder: str) -> Any:
    try:
        import dask
        from distributed import Client, LocalCluster
    except ImportError as error:
        raise Refused(f"this takes Dask's distributed scheduler (Debian's python3-distributed): {error}") from error
    logging.disable(logging.CRITICAL)  # what goes wrong is said here
    try:
        if arguments.scheduler:
            client = Client(arguments.scheduler, timeout=10)
            client.wait_for_workers(1, timeout=60)
            theirs = client.submit(_version, pure=False).result(timeout=60)
            if theirs != kel.__version__:
                raise Refused(f"{arguments.scheduler}: the workers have kel {theirs}, this is {kel.__version__}")
            return client
        dask.config.set({"temporary-directory": folder, "distributed.worker.daemon": True})
        cluster = LocalCluster(n_workers=arguments.workers, threads_per_worker=1, processes=True, dashboard_address=None,
                               memory_limit=0, local_directory=folder, silence_logs=logging.CRITICAL)
        return Client(cluster)
    except (OSError, TimeoutError, ImportError, ValueError) as error:
        raise Refused(f"{arguments.scheduler or 'workers'}: {error}") from error


class Queues:
    """Batches of pairs, a share for each worker: neighbours have pictures in common, which a worker then has already."""

    def __init__(self, batches: List[List[Pair]], workers: Sequence[str]) -> None:
        count = len(workers)
        self.shares = {worker: collections.deque(batches[i * len(batches) // count:(i + 1) * len(batches) // count])
                       for i, worker in enumerate(workers)}

    def __bool__(self) -> bool:
        return any(self.shares.values())

    def take(self, worker: str) -> List[Pair]:
        """The worker's next; where it has none left, the last of who has most, so that the other's go on being neighbours."""
        own = self.shares.setdefault(worker, collections.deque())
        return own.popleft() if own else max(self.shares.values(), key=len).pop()

    def add(self, batch: List[Pair]) -> None:
        next(iter(self.shares.values())).append(batch)


class Pictures:
    """Pictures in the workers' memory, each made by one task for all. Dask hands them to the workers whose pairs need them; where those
    of a worker exceed settings.memory, the longest unused go from all workers, and one that is needed again is made again."""

    def __init__(self, client: Any, pairs: Sequence[Pair], settings: Settings) -> None:
        self.client, self.settings = client, settings
        self.futures: "collections.OrderedDict[str, Any]" = collections.OrderedDict()  # the last used are the last
        self.flying = collections.Counter()  # tasks that use it now
        self.left = collections.Counter(path for pair in pairs for path in {pair.first, pair.second})
        self.given: Dict[str, Set[str]] = {}  # what each worker has had
        self.sizes: Dict[str, int] = {}
        self.failed = collections.Counter()
        self.made: Set[Tuple[str, str]] = set()

    def take(self, batch: Sequence[Pair], worker: str) -> Tuple[List[str], List[Any]]:
        """The pictures of a task that is about to go to a worker."""
        paths = list(dict.fromkeys(path for pair in batch for path in (pair.first, pair.second)))
        given = self.given.setdefault(worker, set())
        given.update(paths)
        for path in paths:
            self.flying[path] += 1
            if path not in self.futures:
                self.futures[path] = self.client.submit(load_picture, path, self.settings, pure=False)
            self.futures.move_to_end(path)
        self._shrink(given)
        return paths, [self.futures[path] for path in paths]

    def _shrink(self, given: Set[str]) -> None:
        guess = max(self.sizes.values(), default=0)
        held = [path for path in self.futures if path in given]
        total = sum(self.sizes.get(path, guess) for path in held)
        for path in held:
            if total <= self.settings.memory:
                break
            if not self.flying[path]:
                total -= self.sizes.get(path, guess)
                self._drop(path)

    def _drop(self, path: str) -> None:
        del self.futures[path]  # Dask forgets what nobody has a future of
        for given in self.given.values():
            given.discard(path)

    def there(self, paths: Sequence[str]) -> bool:
        return all(path not in self.futures or self.futures[path].status != "pending" for path in paths)

    def landed(self, batch: Sequence[Pair], paths: Sequence[str], outcome: Optional[Outcome]) -> bool:
        """A task is over: its pairs are done, where there is an outcome. Whether a picture failed that is worth another try."""
        again = False
        if outcome:
            self.given.setdefault(outcome.worker, set()).update(paths)
            for path, (size, made) in outcome.pictures.items():
                self.sizes[path] = size
                self.made.add(made)
                self.given.setdefault(made[0], set()).add(path)
            self.left.subtract(path for pair in batch for path in {pair.first, pair.second})
        for path in paths:
            self.flying[path] -= 1
            future = self.futures.get(path)
            if future and future.status == "error" and self.failed[path] < 1:
                self.failed[path] += 1  # it may have been beside what killed the worker
                self._drop(path)
                again = True
            elif future and outcome and not self.flying[path] and self.left[path] <= 0:
                self._drop(path)
        return again


def orphans(client: Any, flying: Dict[Any, Tuple[List[Pair], List[str], str]], pictures: Pictures) -> List[Any]:
    """Tasks that Dask leaves alone: meant for a worker that died when there was no other."""
    workers = client.nthreads()
    alone = [future for future, (_, paths, worker) in flying.items()
             if worker not in workers and future.status == "pending" and pictures.there(paths)]
    working = {key for keys in client.processing().values() for key in keys} if alone and workers else set()
    return [future for future in alone if workers and future.key not in working and future.status == "pending"]


def distribute(client: Any, pairs: List[Pair], settings: Settings, batch: int, results: Results, bar: Bar) -> int:
    """Batches of pairs to the workers, few enough at a time that little is in flight; rows as they come. How often pictures were read."""
    from concurrent.futures import CancelledError

    from distributed import KilledWorker, wait

    lost = Refused("the scheduler is gone; run the same again, and it goes on from here")
    queues = Queues([pairs[i:i + batch] for i in range(0, len(pairs), batch)], list(client.nthreads()))
    pictures = Pictures(client, pairs, settings)
    flying: Dict[Any, Tuple[List[Pair], List[str], str]] = {}
    deaths: "collections.Counter[str]" = collections.Counter()
    found, seen = sum(row[1] == "1" for row in results.rows), time.monotonic()
    while queues or flying:
        busy = collections.Counter(worker for _, _, worker in flying.values())
        for worker, threads in client.nthreads().items():
            while queues and busy[worker] < 2 * threads:
                some = queues.take(worker)
                paths, theirs = pictures.take(some, worker)
                future = client.submit(register_batch, some, paths, theirs, settings, pure=False, workers=[worker],
                                       allow_other_workers=True)
                flying[future] = some, paths, worker
                busy[worker] += 1
        if client.nthreads():
            seen = time.monotonic()
        elif time.monotonic() > seen + 20:
            print("no workers; waiting for some", file=sys.stderr)
            seen = time.monotonic()
            if client.cluster is not None:  # ours; one that was killed while it started may be left at that
                count = max(1, len(client.cluster.worker_spec))
                client.cluster.scale(0)
                client.cluster.scale(count)
        if not flying:
            time.sleep(1)
        try:
            done = wait(list(flying), timeout=5, return_when="FIRST_COMPLETED").done if flying else set()
        except TimeoutError:
            done = set()
        except CancelledError:
            raise lost from None
        for future in [*done, *orphans(client, flying, pictures)]:
            if future in done and future.status in ("pending", "lost"):
                continue  # what it gave went with its worker: Dask does it again
            some, paths, _ = flying.pop(future)
            if future.status == "finished":
                outcome = future.result()
                pictures.landed(some, paths, outcome)
                rows = outcome.rows
            elif future.status in ("pending", "error"):
                error = future.exception() if future.status == "error" else None
                future.cancel()
                again = pictures.landed(some, paths, None)
                if error is None or isinstance(error, KilledWorker):
                    deaths.update({pair.id: 2 if error else 1 for pair in some})
                    again = again or deaths[some[0].id] < 4  # another pair may have killed them
                if again or len(some) > 1:
                    for pair in some:
                        queues.add([pair])  # which of them it is will show
                    continue
                died = error is None or isinstance(error, KilledWorker)
                reason = "the workers that tried it died" if died else f"{type(error).__name__}: {error}"
                rows = [([some[0].id, "0", *[""] * 9, "", "", "", " ".join(reason.split())], b"")]
            else:
                raise lost
            results.add(rows)
            found += sum(row[1] == "1" for row, _ in rows)
            bar.show(len(results.rows), found)
        if client.status not in ("running", "connecting"):
            raise lost
    bar.show(len(results.rows), found, end=True)
    return len(pictures.made)


def run(pairs: List[Pair], settings: Settings, arguments: argparse.Namespace, results: Results) -> None:
    with tempfile.TemporaryDirectory(prefix="kel-batch-", ignore_cleanup_errors=True) as folder:
        client = connect(arguments, folder)
        try:
            bar = Bar(len(results.rows), len(results.rows) + len(pairs))
            read = distribute(client, pairs, settings, arguments.batch, results, bar)
            print(f"{len({path for pair in pairs for path in pair[1:]})} pictures, read {read} times", file=sys.stderr)
        except OSError:  # of Dask's, at any call
            raise Refused("the scheduler is gone; run the same again, and it goes on from here") from None
        finally:
            cluster = client.cluster  # ours
            with contextlib.suppress(OSError):  # it may look for a scheduler that is gone
                client.close()
            if cluster is not None:
                cluster.close()


def by_picture(pairs: List[Pair]) -> List[Pair]:
    """Pairs in an order that brings those of the same pictures together, whatever the order in the file."""
    place: Dict[str, int] = {}
    for pair in pairs:
        for path in (pair.first, pair.second):
            place.setdefault(path, len(place))
    return sorted(pairs, key=lambda pair: sorted((place[pair.first], place[pair.second])))


def main(words: Optional[Sequence[str]] = None) -> int:
    parser = argparse.ArgumentParser(prog="python3 -m kel.batch", description="Registers many pairs of pictures.")

    def whole(low: int, high: int) -> Any:
        def parse(text: str) -> int:
            if not text.isdecimal() or not low <= int(text) <= high:
                raise argparse.ArgumentTypeError(f"a number from {low} to {high}, not '{text}'")
            return int(text)
        return parse

    def distance(text: str) -> float:
        try:
            if 0.1 <= float(text) <= 100:
                return float(text)
        except ValueError:
            pass
        raise argparse.ArgumentTypeError(f"a number from 0.1 to 100, not '{text}'")

    parser.add_argument("pairs", metavar="PAIRS.csv", help="columns first, second (pictures, from this file's folder) and, perhaps, id")
    parser.add_argument("--output", metavar="DIR", required=True, help="folder for results.csv and index.html; goes on where it has some")
    parser.add_argument("--scheduler", metavar="tcp://...", help="a Dask cluster that is there; its workers see the same folders")
    parser.add_argument("--workers", type=whole(1, 1000), default=len(os.sched_getaffinity(0)), help="processes here (all cores)")
    parser.add_argument("--batch", type=whole(1, 1000), default=8, help="pairs a task (8)")
    parser.add_argument("--memory", type=whole(1, 1000000), default=500, help="MB of pictures that a worker has ready at a time (500)")
    parser.add_argument("--threshold", type=distance, default=3.0, help="distance at which matches fit, pixels (3)")
    parser.add_argument("--features", type=whole(50, 5000), default=1200, help="most keypoints a picture (1200)")
    parser.add_argument("--working-size", type=whole(200, 8000), default=1000, help="pictures are halved to this (1000)")
    arguments = parser.parse_args(words)
    settings = Settings(arguments.threshold, arguments.features, arguments.working_size, arguments.memory * 1000000)
    try:
        pairs = read_pairs(arguments.pairs)
        results = Results(arguments.output)
        done = {row[0] for row in results.rows}
        left = by_picture([pair for pair in pairs if pair.id not in done])
        if done:
            print(f"{len(pairs) - len(left)} of {len(pairs)} pairs are there already", file=sys.stderr)
        try:
            if left:
                run(left, settings, arguments, results)
        finally:
            write_page(results)
    except Refused as error:
        print(f"kel.batch: {error}", file=sys.stderr)
        return 1
    except OSError as error:  # a full disk, say
        print(f"kel.batch: {arguments.output}: {error}", file=sys.stderr)
        return 1
    except KeyboardInterrupt:
        print("\nkel.batch: broken off; run the same again, and it goes on from here", file=sys.stderr)
        return 130
    print(os.path.join(arguments.output, "index.html"))
    return 0


if __name__ == "__main__":
    from kel import batch  # under its own name, by which workers find it

    sys.exit(batch.main())
