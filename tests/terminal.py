"""Runs a command at a terminal. Prints the screen at its end, then how many lines have left it at the top,
which modes have changed, and how the command ended. "ROWSxCOLUMNS@SECONDS" resizes the window at that time,
"SIGNAL@SECONDS" sends a signal. Usage: terminal.py ROWS COLUMNS [EVENT@SECONDS...] COMMAND..."""
import os, pty, select, signal, sys, termios, time
import pyte

words = sys.argv[1:]
rows, columns = int(words.pop(0)), int(words.pop(0))
events = []
while "@" in words[0]:
    events.append(words.pop(0).split("@"))
screen = pyte.HistoryScreen(columns, rows, history=10000, ratio=0.0001)
modes = set(screen.mode)
stream = pyte.ByteStream(screen)
child, terminal = pty.fork()
if child == 0:
    termios.tcsetwinsize(0, (rows, columns))
    os.execvp(words[0], words)
begin = time.monotonic()
while True:
    due = float(events[0][1]) - (time.monotonic() - begin) if events else 20
    if select.select([terminal], [], [], max(due, 0))[0]:
        try:
            output = os.read(terminal, 65536)
        except OSError:  # the command has ended
            break
        stream.feed(output)
    else:
        what = events.pop(0)[0] if events else "KILL"
        if "x" in what:
            rows, columns = map(int, what.split("x"))
            screen.resize(rows, columns)
            termios.tcsetwinsize(terminal, (rows, columns))
        else:
            os.kill(child, signal.Signals["SIG" + what])
print(*map(str.rstrip, screen.display), sep="\n")
status = os.waitpid(child, 0)[1]
print(len(screen.history.top), "lines above,", sorted(set(screen.mode) ^ modes), "modes, cursor at",
      f"{screen.cursor.y},{screen.cursor.x}", "and", "hidden," if screen.cursor.hidden else "shown,",
      f"signal {os.WTERMSIG(status)}" if os.WIFSIGNALED(status) else f"status {os.WEXITSTATUS(status)}")
