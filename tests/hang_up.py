"""Writes standard input to a terminal, runs a command that reads from there, and hangs up once it has read all:
the next read fails. Usage: hang_up.py COMMAND..."""
import fcntl, os, subprocess, sys, termios, time, tty

terminal, reading = os.openpty()
tty.setraw(reading)
os.write(terminal, sys.stdin.buffer.read())
reader = subprocess.Popen(sys.argv[1:], stdin=reading)
waits = lambda: open(f"/proc/{reader.pid}/stat").read().split()[2] == "S"
while reader.poll() is None and (any(fcntl.ioctl(reading, termios.FIONREAD, bytes(4))) or not waits()):
    time.sleep(0.01)
os.close(terminal)
sys.exit(reader.wait())
