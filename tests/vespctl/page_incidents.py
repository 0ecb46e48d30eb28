#!/usr/bin/env python3
"""Holds the pages of made-up devices against what their sixty days are made of: page_incidents.py VESPCTL

The first screen must have each incident, and a quiet day must be quiet; nothing that others wrote may become markup.
"""

import html
import json
import math
import os
import random
import re
import subprocess
import sys
import tempfile
from datetime import datetime, timedelta
from pathlib import Path

TODAY = 20000  # the page is made on this day; the newest report is of the day before
DAYS = 60
HOSTILE = ["<script>document.title='ran'</script>", "\"><img src=x onerror=\"document.title='ran'\">",
           "</style></title><svg onload=alert(1)>", "' onclick='alert(1)", "&lt;b&gt;", "<!--", "]]>", "שלום",
           "\u202ecod.exe", "\u2066\u200bx\u2069", "\U000e0041", "javascript:alert(1)", "a" * 900 + "<i>"]
COUNTERS = {"cpu.userSeconds": 9e3, "cpu.systemSeconds": 4e3, "cpu.idleSeconds": 3e5, "cpu.contextSwitches": 8e7,
            "cpu.forks": 2e4, "memory.pagedInKiB": 6e5, "memory.pagedOutKiB": 3e6, "memory.majorFaults": 900,
            "pressure.cpuSomeMilliseconds": 5e4, "pressure.ioSomeMilliseconds": 3e4, "time.awakeSeconds": 86400,
            "time.suspends": 14}
for disk in ["vda", "sda"]:
    for name, level in [("reads", 7e4), ("readKiB", 2e6), ("writes", 2e5), ("writtenKiB", 4e6),
                        ("readMilliseconds", 4e4), ("writeMilliseconds", 9e4), ("busyMilliseconds", 8e4)]:
        COUNTERS[f"disk.{name}.{disk}"] = level
for interface in ["eth0", "wlan0"]:
    for name, level in [("receivedKiB", 5e6), ("sentKiB", 8e5), ("receivedPackets", 4e6), ("sentPackets", 2e6)]:
        COUNTERS[f"network.{name}.{interface}"] = level
RARE = ["memory.oomKills", "memory.correctedErrors", "memory.uncorrectedErrors", "time.boots", "time.failedSuspends",
        "network.receiveErrors.eth0", "network.linkLosses.wlan0", "nvme.correctedErrors", "nvme.nonfatalErrors"]
GAUGES = {"memory.availableMiB": 2600, "memory.anonymousMiB": 900, "memory.cachedMiB": 1500,
          "temperature.zoneCelsius.cpu": 52, "temperature.sensorCelsius.nvme": 41, "cpu.frequencyMHz": 2100}


class Device:
    def __init__(self, program, folder):
        self.program, self.path = program, Path(folder) / "device"
        self.call("init", self.path)

    def call(self, *words, status=0):
        done = subprocess.run([self.program, *map(str, words)], capture_output=True)
        assert done.returncode == status, (words, done.returncode, done.stderr)
        return done.stdout.decode()

    def run(self, *words, **more):
        return self.call("-C", self.path, *words, **more)

    def describe(self, day, build="12.4", **more):
        clock = datetime(1970, 1, 1, 9, 15, 2) + timedelta(days=day)
        text = json.dumps({"clock": clock.strftime("%Y-%m-%dT%H:%M:%SZ"), "registry": [],
                           "system": {"osVersion": "Debian 12", "buildVersion": build, "hardwareModel": "phone-1",
                                      "systemID": "1"}, **more})
        (self.path / "device.json").write_text(text)

    def count(self, lines):
        file = self.path.parent / "lines"
        file.write_text("".join(line + "\n" for line in lines))
        self.run("counters", "import", file)

    def page(self, *words):
        return self.run("page", *words)


def figures(random_state, day):
    """What a healthy machine counts in a day: with weekends, and noise of each key's own."""
    weekend = 0.7 if day % 7 in (2, 3) else 1
    scalars = {"linux." + key: int(level * weekend * math.exp(random_state.gauss(0, 0.05 + 0.15 * (i % 3))))
               for i, (key, level) in enumerate(COUNTERS.items())}
    scalars["linux.time.upSeconds"] = scalars["linux.time.awakeSeconds"] = 86400
    scalars |= {"linux." + key: 0 for key in RARE} | ({"app.now-and-then": 3} if day % 5 == 0 else {})
    scalars |= {"app.requests": random_state.randint(90_000, 110_000), "app.failedRequests": random_state.randint(0, 4),
                "app.logins": int(random_state.expovariate(1 / 40)), "app.version": 7}
    means = {"linux." + key: level * random_state.gauss(1, 0.03) for key, level in GAUGES.items()}
    means["app.responseMilliseconds"] = random_state.gauss(80, 5)
    return scalars, means


# name: (what it does to the figures of a day, `back` days before the newest, and what the first screen then says)
def leak(back, scalars, means):
    means["linux.memory.anonymousMiB"] *= 1 + max(0, 20 - back) * 0.03
    means["linux.memory.availableMiB"] -= 900 * max(0, 20 - back) * 0.03


def failing_disk(back, scalars, means):
    if back < 3:
        scalars["linux.disk.readMilliseconds.sda"] *= 12
        scalars["linux.nvme.nonfatalErrors"] = 9


def burst(back, scalars, means):
    if back == 0:
        scalars |= {"app.failedRequests": 580, "linux.memory.oomKills": 7, "linux.memory.correctedErrors": 160}


def restart_loop(back, scalars, means):
    if back == 0:
        scalars["linux.time.boots"] = 43


def key_gone(back, scalars, means):
    if back <= 1:  # a log still has what was there the day before its own
        del scalars["linux.network.receivedKiB.wlan0"], means["linux.temperature.zoneCelsius.cpu"]


def key_new(back, scalars, means):
    if back == 0:
        scalars["app.panics"] = 3


def slow_drift(back, scalars, means):
    means["app.responseMilliseconds"] *= 1 + (DAYS - back) * 0.004


def week_old_burst(back, scalars, means):
    if back == 4:
        scalars["app.failedRequests"] = 900


INCIDENTS = {
    "quiet": (None, ["A quiet day", "nothing of"]),
    "leak": (leak, ["linux.memory.anonymousMiB"]),
    "failing disk": (failing_disk, ["linux.nvme.nonfatalErrors", "transfers that were lost", "linux.disk.readMilli"]),
    "burst": (burst, ["app.failedRequests", "580", "memory that is going bad", "160", "killed for want of memory"]),
    "restart loop": (restart_loop, ["starts of the system", "43", "usually 0"]),
    "missing day": ("missing day", ["No report of 2024-09-27", "1 missed day"]),
    "clock jump": ("clock jump", ["The clock was ahead: a report of 2032", "The clock went back"]),
    "new build": ("new build", ["Another build of the system", "12.5", "12.4 until 2024-10-01"]),
    "key gone": (key_gone, ["linux.network.receivedKiB.wlan0", "gone", "linux.temperature.zoneCelsius.cpu"]),
    "key new": (key_new, ["app.panics", "never before"]),
    "slow drift": (slow_drift, ["app.responseMilliseconds", "slowly rising"]),
    "earlier burst": (week_old_burst, ["A quiet day", "Earlier in the last seven days", "2024-09-29"]),
}


def simulate(device, incident, seed=5):
    change = incident if callable(incident) else None
    random_state = random.Random(seed)
    lines = []
    for back in reversed(range(DAYS)):
        day = TODAY - 1 - back
        scalars, means = figures(random_state, day)
        if change:
            change(back, scalars, means)
        if incident == "missing day" and back == 6:
            continue
        lines += [f"scalar\t{day}\t{key}\t{int(value)}" for key, value in scalars.items()]
        for key, mean in means.items():
            lines += [f"sample\t{day}\t{key}\t{mean * random_state.gauss(1, 0.04):.1f}\t{hour * 3600}"
                      for hour in range(24)]
    whitelist = device.path / "Library/Application Support/Tallybook/Whitelist_Stagebox.ptree"
    text = whitelist.read_text()
    if "app." not in text:
        key = "<key>{}</key><dict><key>app.</key><dict/></dict>"
        whitelist.write_text(text.replace("</dict>\n</ptree>", "<key>App</key><dict>" + key.format("ScalarKeyPrefixes")
                                          + key.format("DistributionKeyPrefixes") + "</dict></dict>\n</ptree>"))
    device.describe(TODAY - 2)
    device.count(lines)
    device.run("catch-up", "--last", DAYS)
    if incident == "clock jump":
        device.describe(TODAY + 3000)
        device.count([f"scalar\t{TODAY + 2999}\tapp.requests\t5"])
        device.run("run", "--", "-f")
    for day in [TODAY - 2, TODAY - 1, TODAY]:
        device.describe(day, "12.5" if incident == "new build" and day >= TODAY - 1 else "12.4")
        device.run("run", "--", "-f")


def first_screen(page):
    section = re.search(r"<section id=changed>(.*?)</section>", page, re.S).group(1)
    return html.unescape(re.sub(r"<[^>]*>", " ", section))


def check_incidents(program):
    for name, (incident, expected) in INCIDENTS.items():
        with tempfile.TemporaryDirectory() as folder:
            device = Device(program, folder)
            simulate(device, incident)
            page = device.page()
            screen = first_screen(page)
            missing = [text for text in expected if text not in screen]
            assert not missing, (name, missing, screen)
            assert ("A quiet day" in screen) == ("A quiet day" in expected), (name, screen)
            assert len(re.findall("<li class=", page.split("</section>")[0])) <= 20, name
            assert len(page) < 300_000, (name, len(page))


def make_hostile(device):
    """Texts of others wherever there may be some."""
    device.path.joinpath("Library/Application Support/Tallybook/Whitelist_Stagebox.ptree").write_text(
        '<?xml version="1.0"?>\n<ptree version="1.0"><dict><key>G</key><dict><key>ScalarKeyPrefixes</key><dict>'
        "<key>s.</key><dict/></dict><key>DistributionKeyPrefixes</key><dict><key>d.</key><dict/></dict></dict></dict>"
        "</ptree>\n")
    for day in range(TODAY - 12, TODAY):
        device.describe(day + 1, build=HOSTILE[day % len(HOSTILE)])
        device.count(f"{kind}\t{day}\t{prefix}{text}\t{1 if day < TODAY - 1 else 99}{end}" for text in HOSTILE
                     for kind, prefixes, end in [("scalar", ("s.", ""), ""), ("sample", ("d.", ""), "\t0")]
                     for prefix in prefixes)
        device.run("run", "--", "-f")
    device.count([f"scalar\t{TODAY}\tkept.alone\t1"])
    outbox = device.path / "outbox"
    with open(outbox / "events.jsonl", "w") as events, open(outbox / "log.jsonl", "w") as log:
        for text in HOSTILE:
            event = {"time": text, "event": text,
                     "payload": {text: text, "n" + text: 1, "z" + text: 0, "msp_index": text}}
            events.write(json.dumps(event, ensure_ascii=False) + "\n")
            log.write(json.dumps({"time": text, "level": "error", "message": text}, ensure_ascii=False) + "\n")
        events.write('{}\n{"event":"\\u0000\\u001b"}\n[]\n')
    for number, text in enumerate(HOSTILE):
        name = text.replace("/", "\\")[:200]
        outbox.joinpath("logs", f"{number + 1}-165-{name}.log").write_text(text)
    outbox.joinpath("logs", "0009-193-log-aggregated.ptree").write_text("<b>")


def check_hostile(program):
    with tempfile.TemporaryDirectory() as folder:
        device = Device(program, folder)
        make_hostile(device)
        page = device.page("--title", HOSTILE[0] + "\u202e")
        own_tags = set("""a b bdi body details div figcaption figure g h1 h2 h3 header html i li main meta nav ol p path
            pre section small span style script summary svg table td th thead title tr ul use defs""".split())
        content = re.sub(r"<(style|script)>.*?</\1>", "", page, flags=re.S)
        assert page.count("<script>") == 1 and len(content) < len(page) - 5000
        for tag in re.findall(r"<[^>]*>?", content):
            plain = re.fullmatch(r"</?([a-z0-9]+|!DOCTYPE html)((?: [a-zA-Z-]+(?:=(?:[a-zA-Z0-9#-]+|\"[^\"<>]*\"))?)*)"
                                 r" ?/?>", tag)
            assert plain and plain.group(1) in own_tags | {"!DOCTYPE html"}, tag
            names = set(re.findall(r" ([a-zA-Z-]+)(?==)", re.sub(r"\"[^\"]*\"", "\"\"", plain.group(2))))
            assert not {name for name in names if name.startswith("on") or name in ("src", "style")}, tag
        for unseen in "\u202e\u2066\u200b\U000e0041\x1b\x00":
            assert unseen not in page, repr(unseen)
        for shown in ["s.&lt;script&gt;", "\\u{202E}cod.exe", "&amp;lt;b&amp;gt;", "d.שלום", "\\u{0}\\u{1B}", "s." +
                      HOSTILE[-1].replace("<i>", "&lt;i&gt;"), "0009-193-log-aggregated.ptree", "1 line cannot be read",
                      "javascript:alert(1) javascript:alert(1)"]:  # time and text of an error
            assert shown in page, shown
        shared = device.page("--share")
        for kept in ["kept.alone", "id=left-out", "Errors in the system log"]:
            assert kept in page and kept not in shared, kept
        policy = re.search(r'Content-Security-Policy content="([^"]*)"', page).group(1)
        assert "unsafe" not in policy and policy.count("'sha256-") == 2 and "default-src 'none'" in policy


def check_first_days_and_storage(program):
    with tempfile.TemporaryDirectory() as folder:
        device = Device(program, folder)
        page = device.page()
        assert "Nothing has been reported yet" in page and "No figure of the flash" in page
        for day in (TODAY - 3, TODAY - 1):
            device.describe(day + 1)
            device.count([f"scalar\t{day}\tlinux.memory.pagedInKiB\t{4096 * (day - TODAY + 5)}",
                          f"scalar\t{day}\tlinux.nvme.correctedErrors\t-1"])
            device.run("run", "--", "-f")
        log = "Date: {0} 00:00:00 +0000\n\n{0} vesprun[1]: UserWamp:2.5;com.quill.NANDInfo.{1}"
        logs = device.path / "outbox/logs"
        logs.joinpath("9998-165-StorageStatus.log").write_text(log.format("2024-09-01", "numPfail:7"))
        logs.joinpath("9999-165-StorageStatus.log").write_text(log.format(
            "2024-09-02", "numPfail:1;com.quill.NANDInfo.numEfail:-1;com.quill.NANDInfo.numDieFailures:1"))
        event = {"time": "2024-09-03T00:00:00Z", "event": "com.quill.massStorage.NANDInfo.FTLCounters_1",
                 "payload": {"numGrownBad": 3, "percentUsed": 79, "zero": 0}}
        device.path.joinpath("outbox/events.jsonl").write_text(json.dumps(event) + "\n")
        page = device.page()
        for shown in ["too early to say", "begins to compare on 2024-10-10", "<td>15.6\u202fMiB", "unknown",
                      "<li class=act>1 die failure counted.", "3 blocks went bad in use", "79\u202f% of the rated",
                      "1 program operation failed.", "1 field always 0", "No report of 2024-10-02"]:
            assert shown in page, shown
        assert "erase operation" not in page


def check_size(program):
    with tempfile.TemporaryDirectory() as folder:
        device = Device(program, folder)
        device.path.joinpath("Library/Application Support/Tallybook/Whitelist_Stagebox.ptree").write_text(
            '<?xml version="1.0"?>\n<ptree version="1.0"><dict><key>G</key><dict><key>ScalarKeyPrefixes</key><dict>'
            "<key>app.</key><dict/></dict></dict></dict></ptree>\n")
        for day in (TODAY - 2, TODAY - 1):
            device.describe(day + 1)
            device.count(f"scalar\t{day}\tapp.{i % 70}.subsystem{i % 7}.counter{i}\t{i * (day % 9)}" for i in range(100_000))
            device.run("run", "--", "-f")
        page = device.page()
        assert 3_000_000 < len(page.encode()) < 8_000_000, len(page.encode())
        assert all(f"counter{i}\t" in page for i in range(0, 100_000, 997))
        assert "counter1\t1\t0\t1\tAz\n" in page


def check_file(program):
    with tempfile.TemporaryDirectory() as folder:
        device = Device(program, folder)
        folder = Path(folder)
        (folder / "page").write_text("earlier")
        (folder / "link").symlink_to("page")
        os.mkfifo(folder / "pipe")
        device.page(folder / "link")
        assert (folder / "page").read_text() == device.page("-") and (folder / "page").stat().st_mode & 0o777 == 0o600
        for name in ["pipe", "nowhere/page", "page/x", "."]:
            device.run("page", folder / name, status=1)


if __name__ == "__main__":
    for check in [check_hostile, check_first_days_and_storage, check_file,
                  *([] if "--short" in sys.argv else [check_incidents, check_size])]:
        check(sys.argv[1])
