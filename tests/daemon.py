"""The daemon with early signals, and with outputs and logs that take nothing. GRELLON names it,
FAST_SLEEP a library that makes its pauses a thousand times shorter."""
import atexit, fcntl, os, socket, subprocess, tempfile, time
from pathlib import Path
from signal import SIGHUP, SIGINT, SIGTERM, SIGUSR1

QUICK = ("schedule = { first_run_after = 0, interval = 0, resume_after = 0, runs = %d }\n"
         "[[controller]]\nclass = 'VeltoQRN3NVMeController'\npending = %d\n")
LONG = QUICK % (100000, 4000000000)
ENVIRONMENT = os.environ | {"LD_PRELOAD": os.environ["FAST_SLEEP"], "GRELLON_SCENARIO": "scenario",
                            "ASAN_OPTIONS": "verify_asan_link_order=0"}
LOG, SCENARIO = Path("log"), Path("scenario")


def start(*before, errors=None):
    """Starts the daemon, through another command if there are words `before`. Its outputs go to the log; standard
    error goes to `errors` if that is given."""
    with LOG.open("wb") as log:
        daemon = subprocess.Popen([*before, os.environ["GRELLON"]], env=ENVIRONMENT, stdout=log,
                                  stderr=errors or log)
    atexit.register(daemon.kill)
    return daemon


def wait_for(text):
    end = time.monotonic() + 20
    while text not in LOG.read_text():
        assert time.monotonic() < end, f"in vain: {text}"
        time.sleep(0.002)


def early_signals():
    """The scenario comes late, from a pipe. Signals that are blocked count once it is read: one to yield
    means nothing before a run, and one to stop leaves nothing to run. Signals that are not blocked end the daemon
    while it waits for the scenario."""
    os.mkfifo(SCENARIO)
    for option, signals, outcome in (
            ("block", [SIGUSR1], (0, 1)), ("block", [SIGTERM], (0, 0)), ("block", [SIGHUP, SIGUSR1], (0, 0)),
            *(("default", [each], (-each, 0)) for each in (SIGTERM, SIGINT, SIGHUP, SIGUSR1))):
        daemon = start("env", "--default-signal=HUP", f"--{option}-signal=USR1,TERM,INT,HUP")
        with SCENARIO.open("w") as late:
            for each in signals:
                daemon.send_signal(each)
            if option == "block":
                late.write(QUICK % (1, 2))
                late.close()
            seen = daemon.wait(20), LOG.read_text().count("running")
        assert seen == outcome and (outcome[0] == 0 or LOG.read_text() == ""), (option, signals, seen)
    SCENARIO.unlink()


def outputs_that_take_nothing():
    """The daemon ends as usual, whatever becomes of its output."""
    faults = "vanish = [4]\nfail_close = true\n"
    for scenario, status in (QUICK % (1, 2), 0), (QUICK % (5, 2) + faults, 0), ("a = \n", 2):
        SCENARIO.write_text(scenario)
        for shell in ('"$0" >&-', '"$0" >&- 2>&-', '"$0" 2>&-', '"$0" > /dev/full', '"$0" > /dev/full 2>&1',
                      '{ sleep 0.1; "$0"; } | true', '{ sleep 0.1; "$0" 2>&1; } | true',
                      '"$0" 2>&1 | { sleep 0.1; cat; }'):
            daemon = start("bash", "-o", "pipefail", "-c", shell)
            assert daemon.wait(9) == status, (scenario, shell, LOG.read_text())


def unread_logs():
    """Nobody reads standard error or, where this test may replace /dev, the system's log."""
    _, full = os.pipe()
    os.write(full, bytes(fcntl.fcntl(full, fcntl.F_GETPIPE_SZ)))
    os.mkdir("dev")
    Path("dev/null").touch()
    log = socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM)
    log.bind("dev/log")
    replace_dev = "mount --bind /dev/null dev/null && mount --rbind dev /dev && exec \"$0\""
    before = ["unshare", "-m", "bash", "-c", replace_dev] if os.system("unshare -m true") == 0 else []
    SCENARIO.write_text(LONG)
    daemon = start(*before, errors=full)
    wait_for("Controller found")
    time.sleep(2)  # the log of that time is more than can wait
    daemon.terminate()
    assert daemon.wait(6) == 0
    SCENARIO.write_text("a = \n")
    assert start(errors=full).wait(9) == 2


with tempfile.TemporaryDirectory() as folder:
    os.chdir(folder)
    early_signals()
    outputs_that_take_nothing()
    unread_logs()
