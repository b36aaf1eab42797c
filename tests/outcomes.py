"""Plays each fault of tests/cases/outcomes.txt with each command, compares the outcomes with those in the file,
whose top explains them, and fails with the difference. SESSION_UPDATE=yes in the environment updates the file."""
import difflib, json, jsonschema, os, re, shutil, struct, subprocess, sys, tempfile
from concurrent.futures import ThreadPoolExecutor
from pathlib import Path

SOURCE, CONTROLLER = Path(os.environ["SOURCE"]), "VeltoQRN3NVMeController"
CASES = SOURCE / "tests/cases/outcomes.txt"
ENVIRONMENT = os.environ | {"LD_PRELOAD": os.environ["FAST_WATCH"], "GRELLON_SCENARIO": "scenario",
                            "ASAN_OPTIONS": "verify_asan_link_order=0"}
SCHEMA = jsonschema.Draft202012Validator(json.loads((SOURCE / "docs/morwick.schema.json").read_text()))
EXPOSED = re.compile('^morwick_(?:info{controller|read_success{.*stream)="(.*?)".*( .)$', re.M)


def run(kind, fault, command):
    """The status, the messages, and what the exposition says."""
    shell = ["bash", "-o", "pipefail", "-c", fault if kind == "output" else '"$@"', "bash", os.environ["MORWICK"]]
    done = subprocess.run(shell + command.replace("FILE", fault).split(), capture_output=True,
                          errors="replace", env=ENVIRONMENT, timeout=60)
    said = re.sub("^Morwick: .*\n|^morwick: ", "", done.stderr, flags=re.M).splitlines()
    if command.endswith("json") and kind != "output":
        objects = [json.loads(line) for line in done.stdout.splitlines()]
        assert all(map(SCHEMA.is_valid, objects)), done.stdout
        assert said == [each["text"] for one in objects for each in one["messages"]], (command, said)
        assert done.returncode == max(one["status"] for one in objects), (command, done.returncode)
    return done.returncode, said, " ".join(map("".join, EXPOSED.findall(done.stdout)))


def outcome(kind, fault, commands):
    """A line of statuses and one for each message, with its subjects in the column of the command."""
    source = fault if kind == "FILE" else CONTROLLER
    if kind == "controller":
        Path("scenario").write_text("\n".join(["[[controller]]", f"class = '{source}'", *fault.split(", ")]))
    with ThreadPoolExecutor(os.cpu_count()) as pool:
        results = list(pool.map(lambda command: run(kind, fault, command), commands))
    rows = {"".join(exposed for _, _, exposed in results): [[str(status)] for status, _, _ in results]}
    for column, (_, said, _) in enumerate(results):
        for line in said:
            subject, text = re.fullmatch(r"(@?(?:\w+: )?)(.*)", line.replace(source + ": ", "@", 1)).groups()
            rows.setdefault(text, [[] for _ in commands])[column].append(subject.removesuffix(": ") or "x")
    cells = [[",".join(cell) or "." for cell in row] for row in rows.values()]
    widths = [max(map(len, column)) for column in zip(*cells)]
    return [f"    {' '.join(map(str.ljust, row, widths))} | {text}".rstrip(" |")
            for text, row in zip(rows, cells)]


expected = CASES.read_text().splitlines()
played = []
with tempfile.TemporaryDirectory() as folder:
    os.chdir(folder)
    shutil.copytree(SOURCE / "examples", ".", dirs_exist_ok=True)
    ftl = Path("ftl.bin").read_bytes()
    for name, content in {"empty": b"", "cut": ftl[:20], "mismatched": struct.pack("<4I", 14, 1, 5, 0),
                          "surplus": ftl + struct.pack("<4I", 0xffff, 1, 0, 0) + b"\n",
                          "nothing": struct.pack("<2I", 700, 0), "large": bytes((16 << 20) + 1)}.items():
        Path(name).write_bytes(content)
    for line in (line for line in expected if not line.startswith("    ")):
        played.append(line)
        if line.startswith("  "):
            played += outcome(kind, line.strip(), commands)
        elif not line.startswith("#"):
            kind, commands = line.split(": ")[0], line.split(": ")[1].split(" | ")
if os.environ.get("SESSION_UPDATE") == "yes":
    CASES.write_text("\n".join([*played, ""]))
    expected = played
difference = list(difflib.unified_diff(expected, played, "expected", "played", lineterm=""))
print("\n".join(difference) or "as expected")
sys.exit(bool(difference))
