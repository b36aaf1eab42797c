"""Reads controllers of the simulated platform, each time in a fresh interpreter."""

import json, os, re, sys, textwrap

from test_morwick import COMMAND, SOURCE, run


PREFACE = """
import concurrent.futures, mmap, morwick, pickle, sys, threading
try: mmap.mmap(-1, 1 << 62)
except OSError: pass
"""


def play(scenario, code, **environment):
    """What the code prints in a fresh interpreter, with the platform's complaints about open handles. A refusal
    of memory came before; errno still tells it."""
    played = run("timeout", "60", sys.executable, "-c", PREFACE + textwrap.dedent(code),
                 GRELLON_SCENARIO=str(SOURCE / "packaging/scenarios" / scenario), **environment)  # fmt: skip
    return played.stdout + played.stderr


def test_controllers_are_read_and_given_back(tmp_path):
    assert play("statistics.toml", """
        with morwick.Controller() as c:
            print(c.name, c.read("statistics") == open("kvr.bin", "rb").read(), c.statistics("ftl")["version"], str(c.statistics()).split()[2])
            print(c.snapshot().dtype.names[0], len(c.snapshot()), c.statistics("msp").fault)
            with concurrent.futures.ThreadPoolExecutor() as pool: print({*pool.map(c.read, ["msp"] * 999)} == {c.read("msp")})
        c.close()
        left = morwick.Controller("VeltoQRN3NVMeController")
        for call in lambda: c.read("kvr"), lambda: left.read("nothing"), lambda: left.read(7), lambda: left.statistics("nothing"):
            try: call()
            except (ValueError, TypeError) as error: print(type(error).__name__, error)
        """.replace('"kvr.bin"', repr(str(SOURCE / "examples/kvr.bin")))) == textwrap.dedent("""\
        VeltoQRN3NVMeController True 5 kvr:
        T 120 None
        True
        ValueError the controller is closed
        ValueError what must be one of kvr, ftl, statistics, msp, snapshot, snapshot_header, band, defects, telemetry, not 'nothing'
        TypeError what must be a str, not int
        ValueError stream must be 'kvr', 'ftl' or 'msp', not 'nothing'
        """)  # fmt: skip
    failing = """
        for name in None, "KVRStorage", "VeltoEmbeddedNVMeController":
            try: morwick.Controller(name).read("msp")
            except morwick.ControllerError as error: print(same := pickle.loads(pickle.dumps(error)), same.result)
        """
    (folder := tmp_path / "folder.toml").write_text("[[controller]]\nclass = 'VeltoQRN3NVMeController'\nmsp = '/'\n"
                                                   f"snapshot_header = ['/dev/null', '/']\ndefects = '/dev/null'\ntelemetry = '{sys.executable}'\n")
    refused, unread, none = [play(scenario, failing).splitlines() for scenario in ("refuses.toml", folder, "empty.toml")]
    assert [none[0], *refused[1:]] == ["no controller is present None", "KVRStorage: the controller is not present None",
                           "VeltoEmbeddedNVMeController: msp: this controller does not offer it None"]  # fmt: skip
    absent = "VeltoQRN3NVMeController"  # although a later class is present
    assert f"{absent}: the controller is not present" in play("fails.toml", f"morwick.Controller('{absent}')")
    found = json.loads(run(COMMAND, "find", "-o", "json", GRELLON_SCENARIO=str(SOURCE / "packaging/scenarios/refuses.toml")).stdout)
    states = [(each["class"], each["state"] != "absent", each["state"] == "present", each.get("result", 0), tuple(each["offers"]))
              for each in found["controllers"]]  # fmt: skip
    assert play("refuses.toml", "print([(c.name, c.present, c.opened, c.result, c.offers) for c in morwick.controllers()])") == f"{states}\n"
    played = play(folder, f"""
        c = morwick.Controller()
        print(c.read("defects"), c.read("telemetry") == open(sys.executable, "rb").read())
        for _ in "12":
            try: c.snapshot()
            except (ValueError, morwick.ControllerError) as error: print(error)
        """)
    assert re.match(r"b'' True\nheader: .*\n.*: snapshot_header: reading failed", played), played
    for line, cause in (refused[0], "VeltoQRN3NVMeController: the connection was refused"), (unread[0], "VeltoQRN3NVMeController: msp: reading failed"):
        words, hexadecimal, result = line.rsplit(maxsplit=2)
        assert words == cause + ", result" and int(result) == int(hexadecimal, 16) != 0
    for closing in "c.close()", "with c: pass":
        assert play("fails.toml", f"c = morwick.Controller()\ntry:\n  {closing}\nexcept Exception as error: print(error, error.result)") == (
            f"VeltoEmbeddedNVMeController: closing the connection failed, result 0xe0000104 {0xe0000104}\n")
    for error in "KeyboardInterrupt('own')", "morwick.ControllerError('own')":
        played = play("fails.toml", f"c = morwick.Controller()\ntry:\n  with c: raise {error}\nexcept BaseException as raised: print(raised); c.read('kvr')")
        assert played.splitlines()[:: len(played.splitlines()) - 1] == ["own", "ValueError: the controller is closed"]


def test_a_call_waits_without_the_interpreter(tmp_path):
    for first in "controllers", "Controller":  # a pipe in the place of the scenario makes them wait for another thread
        (tmp_path / "scenario").unlink(missing_ok=True)
        os.mkfifo(tmp_path / "scenario")
        assert play(tmp_path / "scenario", f"""
            def write(): open("{tmp_path}/scenario", "w").write("[[controller]]\\nclass = 'VeltoQRN3NVMeController'\\n")
            threading.Thread(target=write).start()
            morwick.{first}()
            print("found")
            """) == "found\n"  # fmt: skip
    driver = f"{os.environ.get('LD_PRELOAD', '')}:{os.environ['ODD_DRIVER']}"
    assert play("statistics.toml", """
        import os, socket
        driver, here = socket.socketpair()
        os.dup2(driver.fileno(), 0)
        with concurrent.futures.ThreadPoolExecutor() as pool, morwick.Controller() as c:
            read = pool.submit(c.read, "msp")
            here.recv(1)  # it asks
            closed = pool.submit(c.close)
            print(*concurrent.futures.wait([read, closed], 0.3).done)
            here.send(b"!")
            print(read.exception().result, closed.exception().result)
        """, ODD="77", LD_PRELOAD=driver) == f"\n{2**32 - 8} 9\nanswered\nclosed 77\n"  # fmt: skip
    code = "try: morwick.Controller()\nexcept morwick.ControllerError as error: print(error, error.result)"
    assert play("statistics.toml", code, ODD="0", LD_PRELOAD=driver).endswith("refused, result 0x0 0\n")
