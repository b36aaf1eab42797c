"""Reads controllers of the simulated platform, each time in a fresh interpreter."""

import sys, textwrap

from test_morwick import SOURCE, run


def play(scenario, code):
    """What the code prints in a fresh interpreter, with the platform's complaints about open handles."""
    played = run(sys.executable, "-c", "import concurrent.futures, morwick\n" + textwrap.dedent(code),
                 GRELLON_SCENARIO=str(SOURCE / "packaging/scenarios" / scenario))  # fmt: skip
    return played.stdout + played.stderr


def test_controllers_are_read_and_given_back(tmp_path):
    assert play("statistics.toml", """
        with morwick.Controller() as c:
            print(c.name, c.read("statistics") == open("kvr.bin", "rb").read(), c.statistics("ftl")["version"])
            print(c.snapshot().dtype.names[0], len(c.snapshot()), c.statistics("msp").fault)
            with concurrent.futures.ThreadPoolExecutor() as pool: print({*pool.map(c.read, ["msp"] * 999)} == {c.read("msp")})
        left = morwick.Controller("VeltoQRN3NVMeController")
        print([(each.name, each.present, each.opened) for each in morwick.controllers()])
        for call in lambda: c.read("kvr"), lambda: left.read("nothing"), lambda: left.read(7):
            try: call()
            except (ValueError, TypeError) as error: print(error)
        """.replace('"kvr.bin"', repr(str(SOURCE / "examples/kvr.bin")))) == textwrap.dedent("""\
        VeltoQRN3NVMeController True 5
        T 120 None
        True
        [('VeltoQRN3NVMeController', True, True), ('VeltoEmbeddedNVMeController', False, False), ('KVRStorage', False, False)]
        the controller is closed
        what must be one of kvr, ftl, statistics, msp, snapshot, snapshot_header, band, defects, telemetry, not 'nothing'
        what must be a str, not int
        """)  # fmt: skip
    failing = """
        for name in None, "KVRStorage":
            try: morwick.Controller(name).read("msp")
            except morwick.ControllerError as error: print(error, error.result)
        """
    (folder := tmp_path / "folder.toml").write_text("[[controller]]\nclass = 'VeltoQRN3NVMeController'\nmsp = '/'\n")
    refused, unread = [play(scenario, failing).splitlines() for scenario in ("refuses.toml", folder)]
    assert refused[1] == "KVRStorage: the controller is not present None"
    for line, cause in (refused[0], "VeltoQRN3NVMeController: the connection was refused"), (unread[0], "VeltoQRN3NVMeController: msp: reading failed"):
        words, hexadecimal, result = line.rsplit(maxsplit=2)
        assert words == cause + ", result" and int(result) == int(hexadecimal, 16) != 0
    assert play("fails.toml", failing).startswith("VeltoEmbeddedNVMeController: msp: this controller does not offer it None\n")
    assert "closing the connection failed, result" in play("fails.toml", "morwick.Controller().close()")
    assert "ZeroDivisionError: division" in play("fails.toml", "with morwick.Controller(): 1 / 0").splitlines()[-1]
