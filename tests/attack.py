"""Attacks the programs of the release build, as scripts/attack says, and ends with a table. A
finding is printed with the command that repeats it; the status is 1 then."""
import gzip, itertools, json, os, random, re, select, shlex, shutil, signal, struct, subprocess, sys
import tempfile, threading, time
from concurrent.futures import ThreadPoolExecutor
from functools import partial
from pathlib import Path
from types import SimpleNamespace

SECONDS = float(sys.argv[1]) if len(sys.argv) > 1 else 0  # 0: in full
SEED = sys.argv[2] if len(sys.argv) > 2 else str(time.time_ns())
ROOT, BUILD = os.path.abspath("build/attack"), os.path.abspath("build/release")
MORWICK, GRELLON = BUILD + "/tools/morwick", BUILD + "/grellon"
PRELOAD = f"{BUILD}/tests/librefuse_memory.so {BUILD}/tests/libfast_sleep.so"
STOP = (signal.SIGTERM, signal.SIGINT, signal.SIGHUP)
HARMLESS = (signal.SIGUSR1, signal.SIGPIPE, signal.SIGXFSZ)  # to the daemon
MISUSE = re.compile(rb"still open|already released| is unknown$|of another kind|did not end", re.M)
STARTED = re.compile(rb"start grellon|Controller found")
CONTROL = re.compile("[\0-\x09\x0b-\x1f\x7f-\x9f\udc80-\udcff]")
MOST_OUTPUT = 16 << 20

QUICK = b"schedule = { first_run_after = 0, interval = 0.001, resume_after = 0, runs = %d }\n"
NVME = b"[[controller]]\nclass = 'VeltoQRN3NVMeController'\npending = 3\n"
FAULTS = b"refuse_open = [1]\nfail_request = [3]\nfail_close = true\nvanish = [4]\n"
FILES = (b"statistics = ['kvr.bin', 'ftl.bin']\nmsp = 'msp.bin'\nsnapshot = 'snapshot.bin'\n"
         b"snapshot_header = 'snapshot_header.bin'\ntelemetry = 'kvr.bin'\n"
         b"[[controller]]\nclass = 'KVRStorage'\nstatistics = ['many.bin', 'more.bin']\n")
GOOD = {"live.toml": NVME + FILES, "works.toml": QUICK % 1 + NVME, "bad.toml": b"a = \n",
        "room.toml": NVME + b"statistics = ['many.bin', 'hostile.bin', 'more.bin']\n"}
GOOD |= {f"faults-{runs}.toml": QUICK % runs + NVME + FAULTS for runs in (5, 50, 100000)}
for example in ("kvr.bin", "ftl.bin", "msp.bin", "snapshot.bin", "snapshot_header.bin"):
    GOOD[example] = Path("examples", example).read_bytes() * (3 if example == "snapshot.bin" else 1)  # fills a pipe
# many and more: 2,000 entries each, too large for a double, with more JSON than the command's buffer holds.
# The dump with the odd name is cut. long.bin: 500 snapshot records and a part of one. few: more files than a
# thread of a table takes at once; the first one, long.gz, takes longer than the others together.
many = [b"".join(struct.pack("<IIQ", 4, 1, start << 54 | n) for n in range(2000)) for start in (1, 2)]
GOOD |= {"many.bin": many[0], "more.bin": many[1], "odd\udcff.bin": many[0][:-4]}
GOOD |= {name + ".gz": gzip.compress(GOOD[name + ".bin"], mtime=0) for name in ("kvr", "snapshot")}
GOOD |= {"long.gz": gzip.compress(GOOD["kvr.bin"] * 2000, mtime=0),
         "few": b"\n".join([b"long.gz", *[b"kvr.bin"] * 20, b"ftl.bin"])}
GOOD["long.bin"] = (GOOD["snapshot.bin"] * 2)[:252 * 500 + 9]

PROGRAMS = [([GRELLON], scenario) for scenario in ("works", "bad", "faults-5")]
calls = Path("tests/cases/attack.txt").read_text().replace("\\xff", "\udcff")  # a byte that is not UTF-8
for kind, words in re.findall("^([^#\n]*?): (.*)$", calls, re.M):
    PROGRAMS += [([MORWICK, *words.split(), *(["-o", form] if form != "plain" else [])], "live")
                 for form in kind.split()]

thread = threading.local()


def folder():
    """This thread's folder. At first it has the good files."""
    if not hasattr(thread, "folder"):
        thread.folder = tempfile.mkdtemp(dir=ROOT)
        fill(GOOD)
    return thread.folder


def fill(files):
    for name, content in files.items():
        Path(folder(), name).write_bytes(content)


def take(name):
    """Removes a file and returns its content; None without a file."""
    file = Path(folder(), name)
    content = file.read_bytes() if file.exists() else None
    file.unlink(missing_ok=True)
    return content


def run(program, scenario, draw=None, sent=(), ends=(), **environment):
    """Runs a program to its end and sends it the signals in `sent` at random moments. A signal may end it
    before it says that it has started, and one in `ends` at any time. The result's `fault` is what no
    program may do."""
    preload = f"{PRELOAD} {BUILD}/tests/libfast_watch.so" if "watch" in program else PRELOAD
    environment |= {"GRELLON_SCENARIO": scenario + ".toml", "LD_PRELOAD": preload}
    result = SimpleNamespace(fault=None, deaths=[-each for each in ends])
    result.command = "(cd {}; {} {})  # {}".format(
        folder(), " ".join(f"{name}={shlex.quote(value)}" for name, value in environment.items()),
        shlex.join(program), " ".join(each.name for each in sent))
    with tempfile.TemporaryFile() as output, tempfile.TemporaryFile() as errors:
        process = subprocess.Popen(program, cwd=folder(), env=os.environ | environment,
                                   stdin=subprocess.DEVNULL, stdout=output, stderr=errors)
        for each in sent:
            time.sleep(draw.random() * draw.choice((0.003, 0.01, 0.04)))
            result.deaths += [] if STARTED.search(os.pread(errors.fileno(), 4096, 0)) else [-each]
            os.kill(process.pid, each)
        begin, handle = time.monotonic(), os.pidfd_open(process.pid)
        if not select.select([handle], [], [], 15)[0]:
            result.fault = "hangs"
            process.kill()
        os.close(handle)
        _, status, used = os.wait4(process.pid, 0)
        process.returncode = result.status = os.waitstatus_to_exitcode(status)
        result.took = time.monotonic() - begin
        result.output, result.errors = (
            os.pread(file.fileno(), MOST_OUTPUT, 0) for file in (output, errors))
    result.file = take("out")
    if used.ru_maxrss > 1 << 20:  # KiB
        result.fault = f"takes {used.ru_maxrss} KiB"
    if not 0 <= result.status < 128 and result.status not in result.deaths:
        result.fault = result.fault or "is killed"
    if MISUSE.search(result.errors):
        result.fault = "misuses a handle"
    if [name for name in os.listdir(folder()) if name.startswith("out.") and take(name)]:
        result.fault = "leaves a file beside the one it writes"
    return result


def same(program, one, other):
    """Whether two outputs are equal, but for times and the rates computed from them."""
    if {"watch", "metrics"}.isdisjoint(program) or None in (one, other):
        return one == other
    return len({re.sub(rb" +|\d+([-:.]\d+)+", b"", text) for text in (one, other)}) == 1


def whole_json(program, output, status=None):
    """Whether each line is an object, the last one with `status` if that is given. A watch may end with the
    status of an earlier object."""
    if "json" not in program:
        return True
    try:
        objects = [json.loads(line) for line in output.splitlines()]
        return not objects or status is None or "watch" in program or objects[-1]["status"] == status
    except ValueError:
        return len(output) == MOST_OUTPUT


def ended_well(log):
    return re.search(rb"grellon: (start grellon|(deferring|stopping) grellon daemon)\n$", log) and (
        log.count(b": opened io service") == log.count(b": closing io service"))


def refused_memory(programs):
    for program, scenario in programs:
        good = run(program, scenario, ALLOCATIONS="count")
        for number in range(int(take("count")), 0, -1):
            yield partial(refuse, program, scenario, number, good)


def refuse(program, scenario, number, good):
    result = run(program, scenario, REFUSE=str(number))
    named = re.search(rb": out of memory(\n| after \d+ entries)", result.errors)
    if program == [GRELLON]:
        return result, ended_well(result.errors) if result.status == 0 else (
            result.status == 2 and (named or result.errors == good.errors))
    if result.status == good.status and same(program, result.output, good.output):
        return result, same(program, result.file, good.file)
    return result, result.status == 1 and named and whole_json(program, result.output, 1) and (
        result.file is None or b"read_success" in result.file) and (
        "few" not in program or good.output.startswith(result.output)  # no file is blamed
        and result.errors == b"morwick: out of memory\n")


def refuse_module():
    result = run(["/usr/bin/python3", os.path.abspath("python/tests/memory.py"), "refusals"], "live",
                 PYTHONMALLOC="malloc", PYTHONPATH=BUILD + "/python", SOURCE=os.getcwd())
    return result, result.status == 0 and result.errors == b""  # a driver complains of an open handle


def interrupt(number):
    draw = random.Random(f"{SEED} signals {number}")
    last = draw.choice(STOP)
    if number % 2 == 0:
        sent = [*draw.choices(HARMLESS, k=draw.randrange(3)), last]
        scenario = draw.choice(("works", "faults-5", "faults-50", "faults-100000"))
        result = run([GRELLON], scenario, draw, sent)
        return result, result.status in result.deaths or (
            result.status == 0 and ended_well(result.errors))
    if number % 4 == 1:
        program = [MORWICK, *"watch -s kvr --every".split(), draw.choice(("0.1", "0.1", "60000")),
                   "-o", draw.choice(("csv", "json", "normal"))]
        result = run(program, "live", draw, [last])
        return result, result.status in (0, *result.deaths) and whole_json(program, result.output)
    program = [MORWICK, *draw.choice(("read telemetry -w out", "metrics -w out")).split()]
    result = run(program, "live", draw, [last], STOP)
    whole = same(program, result.file, run(program, "live").file)
    return result, whole or result.status in result.deaths and result.file is None


def run_while(act, call):
    """Runs the command while a thread acts again and again."""
    done = threading.Event()
    with ThreadPoolExecutor() as actor:
        acting = actor.submit(lambda: [act() for _ in iter(done.is_set, True)])
        try:
            result = run([MORWICK, *call.split()], "live")
        finally:
            done.set()
        acting.result()
    return result


def exchange(number):
    """Writes a file while the link to it is exchanged for one to a device, or its folder is moved."""
    here, name = folder() + "/there", ("link", "old")[number % 2]
    os.mkdir(here)
    old = GOOD["kvr.bin"][::-1] + b"old"  # other bytes than what replaces it, and more
    fill({"there/old": old})
    os.symlink("old", here + "/link")

    def move_folder():
        os.rename(here, here + ".moved")
        os.rename(here + ".moved", here)

    def exchange_link():
        for target in ("/dev/null", "old"):
            os.symlink(target, here + "/next")
            os.rename(here + "/next", here + "/link")

    result = run_while((exchange_link, move_folder)[number % 2], "read telemetry -w there/" + name)
    good = set(os.listdir(here)) == {"old", "link"} and take("there/old") in (old, GOOD["kvr.bin"])
    shutil.rmtree(here)
    return result, good


def shrink(number):
    """Makes a table of a file that is overwritten: a row has all values or a fault."""
    file = Path(folder(), "s")
    file.touch()
    result = run_while(lambda: [file.write_bytes(content) for content in (bytes(20000), GOOD["kvr.bin"], b"")],
                       "table -s kvr -n hostWrites s s s")
    return result, re.fullmatch(rb'file,fault,hostWrites\n(s,(,123456789|"?(there is nothing|the statistics end|'
                                rb'no statistics).*,)\n){3}', result.output)


def many_entries(call, room="unlimited"):
    """Reads entries that need more memory than the command takes, or than its caller leaves it (in bytes)."""
    fill({"hostile.bin": b"\x36\0\0\0\0\0\0\0" * 262144})  # each eight bytes make 256 entries
    result = run(["prlimit", f"--as={room}:", MORWICK, *call.split()], "room")
    counts = [int(count) for count in re.findall(rb"out of memory after (\d+) entries", result.errors)]
    lines = result.output.splitlines()
    if result.status != 1 or not counts or room != "unlimited" and counts[0] >= 500000:
        return result, False
    if "normal" in call:  # all that was read is printed
        return result, counts == [sum(len(line.split()) - 2 for line in lines)]
    if "metrics" in call:
        return result, b'morwick_read_success{stream="msp"} 1' in lines
    objects = [json.loads(line) for line in lines] if "json" in call else []
    if "watch" in call:  # compares the third reading with the first
        return result, [each["status"] for each in objects] == [0, 1, 0] and len(objects[2]["changes"]) == 2000
    return result, all(each["status"] == 1 for each in objects)


def feed(number):
    draw = random.Random(f"{SEED} bytes {number}")
    fill({name: draw.choice((good, mutated(draw, good))) for name, good in GOOD.items()})
    program, scenario = draw.choice(PROGRAMS + [([GRELLON], "faults-50")] * 9)
    if program == [GRELLON]:
        result = run(program, scenario, draw, (signal.SIGUSR1, signal.SIGTERM))
        return result, result.status in (0, *result.deaths) or (
            result.status == 2 and result.errors.count(b"\n") == 1)
    if number % 8 == 0:  # at a terminal
        result = run(["script", "-qec", shlex.join(program), "/dev/null"], scenario)
        text = result.output.replace(b"\r\n", b"\n").decode(errors="surrogateescape")
        return result, not CONTROL.search(text)
    result = run(program, scenario)
    return result, whole_json(program, result.output) and (
        result.status == 0 or result.status < 3 and result.errors + result.output != b"")


def mutated(draw, good):
    if draw.random() < 0.1:
        return draw.randbytes(draw.choice((0, 1, 40, 70000)))
    text = bytearray(good)
    for _ in range(draw.choice((1, 1, 3, 20))):
        at = draw.randrange(len(text) + 1)
        at -= at % draw.choice((1, 4))
        piece = draw.choice((draw.randbytes(draw.choice((1, 4, 16))), text[at:at + 8], b"[", b".a",
                             b"\n", b'"', b"%s%n", b"%9999u\0", b"\x1b[1m\xc2\x9b", b"\0\0\0\x80",
                             b"\xff\xff\xff\xff", b"\0\0\0\0", b"\1\0\0\0"))
        piece *= draw.choice((1, 1, 1, 500, 30000))
        text[at:at + draw.choice((0, len(piece), 40))] = piece
    return bytes(text)


def carry_out(attack, jobs, pool):
    """Returns the number of runs, of findings, and the longest run in seconds."""
    jobs, end, numbers = list(jobs), float("inf"), itertools.count()
    if SECONDS > 0:  # the first hundred always
        jobs[100:] = random.Random(SEED).sample(jobs[100:], max(0, len(jobs) - 100))
        end = time.monotonic() + SECONDS / 6  # long attacks

    def one(index, job):
        if index >= 100 and time.monotonic() > end:
            return None
        result, fine = job()
        if fine and not result.fault:
            return result.took, 0
        kept = f"{ROOT}/{attack}-{next(numbers)}"
        shutil.copytree(folder(), kept, symlinks=True)
        print(f"{attack}: {result.fault or 'goes wrong'}, status {result.status}:",
              result.command.replace(folder(), kept), result.errors[-300:], flush=True)
        return result.took, 1

    times, found = zip(*filter(None, pool.map(one, itertools.count(), jobs)))
    return len(times), sum(found), max(times)


for ignored in STOP:  # background jobs of a shell ignore some, and so do all programs that they start
    signal.signal(ignored, signal.SIG_DFL)
shutil.rmtree(ROOT, ignore_errors=True)
os.makedirs(ROOT)
print("seed", SEED, flush=True)
with ThreadPoolExecutor(os.cpu_count()) as workers:
    table = [(attack, *carry_out(attack, jobs, workers)) for attack, jobs in {
        "daemon": refused_memory(PROGRAMS[:3]), "memory": refused_memory(PROGRAMS[3:]), "module": [refuse_module],
        "room": [partial(many_entries, "stats -s kvr --summary hostile.bin", "100000000"), *(
            partial(many_entries, words) for words in (
                "stats -s kvr -o normal hostile.bin", "stats -s kvr -o json hostile.bin",
                "metrics kvr=hostile.bin msp=msp.bin", "diff -s kvr -o json hostile.bin hostile.bin",
                "watch -s kvr --every 0.1 --count 2 -o json"))],
        "signals": (partial(interrupt, n) for n in range(1000)),
        "links": (partial(exchange, n) for n in range(1000)),
        "files": (partial(shrink, n) for n in range(100)),
        "bytes": (partial(feed, n) for n in range(10000))}.items()]
print("attack      runs  findings  worst time")
for row in table:
    print("{:8} {:7} {:9} {:9.2f} s".format(*row))
sys.exit(any(row[2] for row in table))
