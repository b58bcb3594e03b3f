#!/usr/bin/env python3
"""Types lines into an interactive shell on a pseudo-terminal, pressing Tab after each, and
prints for each line, on one line, what the shell then showed (escape sequences removed).

usage: type_in_shell.py SHELL SETUP LINE...
SETUP is run first (it sources the completion script); each LINE is typed without Enter and
abandoned with Ctrl-C after Tab."""
import os
import pty
import re
import select
import sys
import time

SHELLS = {
    "bash": ["bash", "--norc", "--noprofile", "-i"],
    "zsh": ["zsh", "-f", "-i"],
    "fish": ["fish", "--no-config", "-i"],
}
PRELUDE = {
    "bash": "PS1='$ '; bind 'set show-all-if-ambiguous on' 2>/dev/null",
    "zsh": "PS1='$ '; autoload -Uz compinit && compinit -u -D",
    "fish": "function fish_prompt; echo '$ '; end; set fish_greeting",
}
ESCAPES = re.compile(rb"\x1b(\[[0-9;?]*[ -/]*[@-~]|\][^\x07\x1b]*(\x07|\x1b\\)|[()][0-9A-Za-z]|[=>78MDEHc])")


def read_for(fd, seconds, quiet=0.4):
    """Reads until the shell has been silent for `quiet` seconds, or `seconds` have passed."""
    data = b""
    end = time.monotonic() + seconds
    while time.monotonic() < end:
        ready, _, _ = select.select([fd], [], [], min(quiet, max(0.0, end - time.monotonic())))
        if not ready:
            break
        try:
            chunk = os.read(fd, 65536)
        except OSError:
            break
        if not chunk:
            break
        data += chunk
    return data


def main():
    shell, setup, lines = sys.argv[1], sys.argv[2], sys.argv[3:]
    pid, fd = pty.fork()
    if pid == 0:
        os.environ["TERM"] = "dumb" if shell == "bash" else "xterm"
        os.environ.pop("PROMPT_COMMAND", None)
        os.execvp(SHELLS[shell][0], SHELLS[shell])
    os.write(fd, (PRELUDE[shell] + "\n" + setup + "\n").encode())
    read_for(fd, 10.0, quiet=1.0)
    for line in lines:
        os.write(fd, line.encode())
        read_for(fd, 5.0)
        os.write(fd, b"\t")
        shown = read_for(fd, 10.0, quiet=0.8)
        os.write(fd, b"\x03")
        read_for(fd, 5.0)
        text = ESCAPES.sub(b"", shown).replace(b"\r", b"").replace(b"\n", b" ")
        sys.stdout.write(line + "\t" + line + text.decode("utf-8", "replace") + "\n")
        sys.stdout.flush()
    try:
        os.kill(pid, 9)
    except OSError:
        pass
    os.waitpid(pid, 0)


main()
