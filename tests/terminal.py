"""Runs a command at a terminal. Prints the screen at its end, then how many lines have left it at the top,
which modes have changed, and how the command ended. "ROWSxCOLUMNS@SECONDS" resizes the window at that time,
"SIGNAL@SECONDS" sends a signal. Usage: terminal.py ROWS COLUMNS [EVENT@SECONDS...] COMMAND..."""
import fcntl, os, pty, select, signal, struct, sys, termios, time
import pyte

words = sys.argv[1:]
rows, columns = int(words.pop(0)), int(words.pop(0))
events = []
while "@" in words[0]:
    what, when = words.pop(0).split("@")
    events.append((float(when), what))
screen = pyte.HistoryScreen(columns, rows, history=10000, ratio=0.0001)
modes = set(screen.mode)
stream = pyte.ByteStream(screen)
child, terminal = pty.fork()
if child == 0:
    time.sleep(0.2)  # until the window has its size
    os.execvp(words[0], words)
resize = lambda: fcntl.ioctl(terminal, termios.TIOCSWINSZ, struct.pack("HHHH", rows, columns, 0, 0))
resize()
begin = time.monotonic()
while True:
    due = events[0][0] + 0.2 - (time.monotonic() - begin) if events else 20
    if select.select([terminal], [], [], max(due, 0))[0]:
        try:
            output = os.read(terminal, 65536)
        except OSError:  # the command has ended
            break
        stream.feed(output)
    elif events:
        what = events.pop(0)[1]
        if "x" in what:
            rows, columns = map(int, what.split("x"))
            screen.resize(rows, columns)
            resize()
        else:
            os.kill(child, signal.Signals["SIG" + what])
    else:
        os.kill(child, signal.SIGKILL)
for line in screen.display:
    print(line.rstrip())
status = os.waitpid(child, 0)[1]
print(len(screen.history.top), "lines above,", sorted(set(screen.mode) ^ modes), "modes, cursor at",
      f"{screen.cursor.y},{screen.cursor.x}", "and", "hidden," if screen.cursor.hidden else "shown,",
      f"signal {os.WTERMSIG(status)}" if os.WIFSIGNALED(status) else f"status {os.WEXITSTATUS(status)}")
