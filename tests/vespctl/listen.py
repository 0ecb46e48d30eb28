#!/usr/bin/env python3
"""Sends datagrams to `vespctl listen` (argument 1: vespctl) and looks at what was counted.

A small model of its own says what each line counts as.
"""
import fcntl
import json
import os
import pathlib
import pwd
import random
import shutil
import signal
import socket
import subprocess
import sys
import tempfile
import threading
import time
from fractions import Fraction

VESPCTL = sys.argv[1]
OTHER_USER = 12345
failures = []


def check(what, found, expected):
    if found != expected:
        failures.append(f"{what}: {found!r} instead of {expected!r}")


class Listener:
    """A listener on a device of its own; a second start goes on with the same device."""

    def __init__(self, folder, description="{}"):
        self.folder = pathlib.Path(folder)
        self.path = str(self.folder / "socket")
        self.device = str(self.folder / "device")
        if not os.path.exists(self.device):
            subprocess.run([VESPCTL, "init", self.device], check=True, stdout=subprocess.DEVNULL)
            (self.folder / "device" / "device.json").write_text(description)
        self.process = None

    def start(self, *arguments, **options):
        self.process = subprocess.Popen(
            [VESPCTL, "-C", self.device, "listen", *(arguments or ["--socket", self.path])], **options)
        deadline = time.monotonic() + 10
        while not arguments and not self.answers() and time.monotonic() < deadline:
            time.sleep(0.01)
        return self

    def answers(self):
        with socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM) as probe:
            return probe.connect_ex(self.path) == 0

    def send(self, *datagrams, user=None):
        child = os.fork()
        if child == 0:
            if user is not None:
                os.setgroups([])
                os.setgid(user)
                os.setuid(user)
            with socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM) as sender:
                sender.connect(self.path)
                for datagram in datagrams:
                    sender.send(datagram.encode() if isinstance(datagram, str) else datagram)
            os._exit(0)
        check("sending", os.waitpid(child, 0)[1], 0)

    def stop(self, how=signal.SIGTERM):
        self.process.send_signal(how)
        return self.process.wait(timeout=30)

    def counters(self):
        lines = subprocess.run([VESPCTL, "-C", self.device, "counters", "dump"], check=True,
                               capture_output=True, text=True).stdout.splitlines()
        scalars, samples = {}, {}
        for line in lines:
            kind, _, key, value, *_ = line.split("\t")
            if kind == "scalar":
                scalars[key] = int(value)
            else:
                samples.setdefault(key, []).append(float(value))
        return scalars, samples


def forms(folder):
    """Every form of a line, and what becomes of it."""
    device = Listener(folder)
    device.start()
    device.send(
        "a:1|c\na:2:3|c\n\na:-1|c", "r:1|c|@0.4\nr2:-1:1|c|@.4\nr3:9007199254740993|c|@1.0\n"
        "wrap:9223372036854775807|c\nwrap:1|c", "g:5|g\ng:-5|g\nplus:+7|g", "t:1.5:2|ms\nt:-3e2|h\nt:4|d",
        b"x:1|c\n" + b" " * 8200, "two:1|c\ntwo:bad|c", "k:1|s\nk:1|c|#tag:a\nk:1|c|@0.5|#tag",
        "bad:1:x|c\nbad:|c\nbad:1|c|\n:1|c\nb|d:1|c\nnothing\nbad:1|q\nbad:1|g|@0.5\nbad:1|ms|@0.5\nbad:1|c|@0\n"
        "bad:1|c|@1.5\nbad:nan|ms\nbad:inf|h\nbad:1.5|c\nbad:9223372036854775808|c\nbad:1:|c\n"
        "bad:9223372036854775807|c|@0.1\nbad:1|c|@0.5|@0.5\nbad:x|s|\nbad:x|c|#t",
        b"\xff:1|c\n\x01:1|c\n\x01:1|s")
    check("status", device.stop(), 0)
    scalars, samples = device.counters()
    check("scalars", scalars, {
        "a": 5, "r": 3, "r2": 0, "r3": 9007199254740993, "wrap": -2**63, "g": -5, "plus": 7, "two": 1,
        "vesprun.listen.dropped.form": 24 + 1, "vesprun.listen.dropped.kind": 3})
    check("samples", samples, {"t": [1.5, 2, -300, 4]})
    log = (pathlib.Path(device.device) / "outbox" / "log.jsonl").read_text()
    check("lines of the log on dropped lines", log.count("is dropped"), 2)
    check("keys in the log", "bad" in log, False)


def random_rates(folder):
    device = Listener(folder)
    device.start()
    chance = random.Random(5)
    expected = {}
    lines = []
    for _ in range(2000):
        value, rate = chance.randrange(-10**6, 10**6), f"0.{chance.randrange(1, 1000)}"
        quotient = abs(value) / Fraction(rate)
        rounded = int(quotient + Fraction(1, 2)) * (1 if value >= 0 else -1)
        key = f"k{chance.randrange(50)}"
        expected[key] = expected.get(key, 0) + rounded
        lines.append(f"{key}:{value}|c|@{rate}")
    device.send(*lines)
    device.stop()
    check("rates", device.counters()[0], expected)


def rights_and_bounds(folder):
    """The sender's user, keys by right, bounds that a restart does not forget."""
    os.chmod(folder, 0o755)
    device = Listener(folder, json.dumps({"senders": {"*": ["app."], str(OTHER_USER): ["mine.", "m"]}}))
    device.start()
    device.send(*[f"mine.{i}:1|{'ms' if i % 2 == 0 else 'c'}" for i in range(600)], "app.x:1|c", "x:bad|c", "linux.x:1|c",
                user=OTHER_USER)
    device.send("app.y:1|c\nmine.x:1|c", user=OTHER_USER + 1)
    check("killed", device.stop(), 0)
    device.start()
    device.send(*[f"mine.n{i}:1|c" for i in range(600)], "mine.1:1|c\nmine.1:1|ms", user=OTHER_USER)
    device.stop()
    scalars, samples = device.counters()
    dropped = {reason: scalars.pop("vesprun.listen.dropped." + reason, 0)
               for reason in ("form", "kind", "rights", "bounds")}
    check("dropped", dropped, {"form": 1, "kind": 0, "rights": 3, "bounds": 200})
    check("keys", (len(scalars), len(samples)), (701, 301))
    check("counted twice", (scalars["mine.1"], samples["mine.1"]), (2, [1]))
    note = pathlib.Path(device.device, "run", "counted-keys.json")
    content = json.loads(note.read_text())
    note.write_text(json.dumps(content | {"day": content["day"] - 1}))
    device.start()
    device.send("mine.later:1|c", user=OTHER_USER)
    device.stop()
    check("a key on the day after", device.counters()[0].get("mine.later"), 1)


def rights_of_the_owner(folder):
    """Root on another user's directory goes on as that user, with that user's groups."""
    os.chmod(folder, 0o755)
    nobody = pwd.getpwnam("nobody")
    for user, group, own_group, groups in ((OTHER_USER, 54321, 54321, []), (OTHER_USER, 0, nobody.pw_gid, []),
                                           (nobody.pw_uid, 0, nobody.pw_gid, [nobody.pw_gid])):
        device = Listener(folder)
        subprocess.run(["chown", "-R", f"{user}:{group}", device.device], check=True)
        device.path = device.device + "/run/counters"
        device.process = subprocess.Popen([VESPCTL, "-C", device.device, "listen"],
                                          preexec_fn=lambda: os.setgroups([0, 7]))
        while not device.answers() and device.process.poll() is None:
            time.sleep(0.01)
        status = dict(line.split(":", 1) for line in open(f"/proc/{device.process.pid}/status", encoding="utf-8"))
        check(f"rights for {user}:{group}", [list(map(int, status[name].split())) for name in ("Uid", "Gid", "Groups")],
              [[user] * 4, [own_group] * 4, groups])
        device.stop()


def values_of_a_day(folder):
    device = Listener(folder)
    with open(device.folder / "lines", "w", encoding="ascii") as lines:
        today = int(time.time() // 86400)
        lines.writelines(f"sample\t{today}\tt\t1\t{i % 86400}\n" for i in range(999_999))
    subprocess.run([VESPCTL, "-C", device.device, "counters", "import", lines.name], check=True,
                   stdout=subprocess.DEVNULL)
    device.start()
    device.send("t:1:2|ms", "t:3|ms", "t:4|ms")
    device.stop()
    dump = subprocess.run([VESPCTL, "-C", device.device, "counters", "dump"], capture_output=True,
                          text=True, check=True).stdout
    check("values", dump.count("sample"), 1_000_000)
    check("dropped values", device.counters()[0]["vesprun.listen.dropped.bounds"], 2)


def sockets(folder):
    """Whose the path is, and a socket that was handed over."""
    device = Listener(folder)
    device.start()
    device.send("")  # what it has begun with is done
    check("mode", os.stat(device.path).st_mode & 0o777, 0o666)
    second = subprocess.run([VESPCTL, "-C", device.device, "listen", "--socket", device.path],
                            capture_output=True, text=True, check=False)
    check("second listener", (second.returncode, second.stderr.count("\n")), (1, 1))
    device.send("a:1|c")
    device.stop(signal.SIGKILL)
    check("socket after a kill", os.path.exists(device.path), True)
    held = os.open(folder, os.O_RDONLY)
    fcntl.flock(held, fcntl.LOCK_EX)  # as one that is about to take the place
    threading.Timer(0.5, os.close, [held]).start()
    began = time.monotonic()
    device.start()
    check("waits its turn", time.monotonic() - began > 0.4, True)
    device.send("a:1|c")
    device.stop()
    check("socket after an end", os.path.exists(device.path), False)
    pathlib.Path(device.path).write_text("mine")
    third = subprocess.run([VESPCTL, "-C", device.device, "listen", "--socket", device.path],
                           capture_output=True, text=True, check=False)
    check("a file in the way", (third.returncode, pathlib.Path(device.path).read_text()), (1, "mine"))
    os.remove(device.path)

    with socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM) as handed_over:
        handed_over.bind(device.path)
        device.send("c:1|c")  # of nobody, before the socket asks who sends
        handed_over.setsockopt(socket.SOL_SOCKET, socket.SO_PASSCRED, 1)

        def hand_over():
            os.dup2(handed_over.fileno(), 3)

        note = pathlib.Path(device.device, "run", "counted-keys.json")
        note.unlink()
        device.send("b:1|c")
        script = f'LISTEN_PID=$$ LISTEN_FDS=1 exec "{VESPCTL}" -C "{device.device}" listen'
        device.process = subprocess.Popen(["bash", "-c", script], pass_fds=(3,), close_fds=True,
                                          preexec_fn=hand_over)
        device.send("b:1|c")
        while not note.exists() and device.process.poll() is None:
            time.sleep(0.02)  # until the first checkpoint
        check("status when handed over", device.stop(), 0)
    scalars = device.counters()[0]
    check("handed over", [scalars.get(key) for key in "abc"], [1, 2, None])


def flood(folder):
    """One sender floods; another gets its datagrams through."""
    device = Listener(folder)
    device.start()
    code = ("import socket, sys\n"
            "s = socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM); s.connect(sys.argv[1])\n"
            "s.setblocking(False)\n"
            "while True:\n try: s.send(b'flood:1|c\\n' * 800)\n except BlockingIOError: pass\n")
    with subprocess.Popen([sys.executable, "-c", code, device.path], stderr=subprocess.DEVNULL) as other:
        began = time.monotonic()
        device.send(*["polite:1|c"] * 100)
        took = time.monotonic() - began
        other.kill()
    device.stop()
    check("polite datagrams", (device.counters()[0]["polite"], took < 10), (100, True))


def foreign_client(folder):
    """A StatsD client of others, with nothing but the socket's path."""
    device = Listener(folder)
    device.start()
    script = ("const client = new (require('hot-shots'))({protocol: 'uds', path: process.argv[1]});"
              "client.increment('app.requests', 3); client.increment('app.sampled', 1, 1);"
              "client.gauge('app.open', 5); client.timing('app.milliseconds', 12.5);"
              "client.histogram('app.size', 7); client.close(() => process.exit(0));")
    subprocess.run(["node", "-e", script, device.path], check=True, timeout=60)
    device.stop()
    check("of a StatsD client", device.counters(),
          ({"app.requests": 3, "app.sampled": 1, "app.open": 5},
           {"app.milliseconds": [12.5], "app.size": [7]}))


def has_foreign_client():
    return shutil.which("node") is not None and subprocess.run(
        ["node", "-e", "require('hot-shots'); require('unix-dgram')"], check=False,
        stderr=subprocess.DEVNULL).returncode == 0


for case in (forms, random_rates, rights_and_bounds, rights_of_the_owner, values_of_a_day, sockets, flood,
             foreign_client):
    if case in (rights_and_bounds, rights_of_the_owner) and os.geteuid() != 0:
        continue
    if case is foreign_client and not has_foreign_client():
        continue
    with tempfile.TemporaryDirectory() as place:
        try:
            case(place)
        except (OSError, KeyError, subprocess.SubprocessError) as error:
            failures.append(f"{case.__name__}: {error!r}")
print("\n".join(failures), file=sys.stderr)
sys.exit(1 if failures else 0)
