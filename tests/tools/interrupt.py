#!/usr/bin/python3
# SPDX-License-Identifier: Apache-2.0
"""interrupt.py COMMAND...: runs a command that asks for a passphrase on a terminal of its own, three times:
types Ctrl-C, sends SIGTERM, and types the passphrase of standard input. Prints how each ended, and whether the
terminal shows again what is typed, and what was shown of the passphrase."""
import os
import pty
import signal
import subprocess
import sys
import termios
import time

passphrase = sys.stdin.read().strip()


def until(master, wanted):
    seen = b""
    while wanted not in seen:
        seen += os.read(master, 1000)
    return seen


def run(act):
    master, slave = pty.openpty()

    def own_terminal():
        os.setsid()
        import fcntl
        fcntl.ioctl(slave, termios.TIOCSCTTY, 0)

    process = subprocess.Popen(sys.argv[1:], stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                               stderr=subprocess.DEVNULL, preexec_fn=own_terminal)
    until(master, b": ")
    hidden = not termios.tcgetattr(slave)[3] & termios.ECHO
    act(master, process)
    status = process.wait(20)
    shown = termios.tcgetattr(slave)[3] & termios.ECHO != 0
    os.set_blocking(master, False)
    try:
        leaked = passphrase.encode() in os.read(master, 1000)
    except OSError:
        leaked = False
    ended = signal.Signals(-status).name if status < 0 else f"exit {status}"
    print(ended, "hidden" if hidden else "seen", "restored" if shown else "dumb", "leaked" if leaked else "kept")


run(lambda master, process: os.write(master, b"\x03"))
run(lambda master, process: (os.write(master, b"half"), time.sleep(0.1), process.send_signal(signal.SIGTERM)))
run(lambda master, process: os.write(master, passphrase.encode() + b"\n"))
run(lambda master, process: os.write(master, b"wrong\n"))
