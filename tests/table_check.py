"""Compares a table with what `stats` prints for the same dumps, each value and each fault, and with a table of
a third of its columns.
Usage: table_check.py MORWICK STREAM FILE..."""
import csv, io, subprocess, sys

morwick, stream, *files = sys.argv[1:]
run = lambda *words: subprocess.run([morwick, *words], capture_output=True, errors="surrogateescape")
table = run("table", "-s", stream, "--", *files)
heading, *rows = csv.reader(io.StringIO(table.stdout, newline=""))
assert [row[0] for row in rows] == files, "a row for each file, in their order"
errors = [f"morwick: {row[0]}: {row[1]}" for row in rows if row[1]]
for row in rows:
    stats = run("stats", "-s", stream, "-o", "csv", "--", row[0])
    values = dict([*csv.reader(io.StringIO(stats.stdout))][1:])  # the last one of a name
    expected = [values.pop(name, "") for name in heading[2:]]
    assert expected == row[2:], [(n, e, v) for n, e, v in zip(heading[2:], expected, row[2:]) if e != v]
    # One value of an array is named like the array, and has no column; the fault tells.
    assert not values or (row[1] and all(name + "0" in heading for name in values)), values
    faults = [line.removeprefix(f"morwick: {row[0]}: ") for line in stats.stderr.splitlines() if "the end record" not in line]
    assert row[1] == "; ".join(faults), (row[1], faults)
    assert (stats.returncode == 0) == (row[1] == "")
some = run("table", "-s", stream, "-n", ",".join(heading[2::3]), "--", *files)
assert list(csv.reader(io.StringIO(some.stdout, newline=""))) == [row[:2] + row[2::3] for row in (heading, *rows)]
assert (table.stderr.splitlines(), table.returncode) == (errors, bool(errors)), table.stderr
print(len(rows), "dumps agree,", len(errors), "of them with a fault,", len(heading) - 2, "columns")
