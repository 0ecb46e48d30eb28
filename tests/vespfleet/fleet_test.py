#!/usr/bin/env python3
"""Compares vespfleet with a small model of what it promises: fleet_test.py PROGRAM

Each case runs on an SQLite file and, when VESPFLEET_TEST_SERVER has its address, in a ClickHouse database.
"""

import base64
import gzip
import hashlib
import http.server
import json
import math
import os
import random
import signal
import sqlite3
import ssl
import subprocess
import sys
import tempfile
import threading
import time
import urllib.request
import zlib
from collections import defaultdict
from fractions import Fraction
from pathlib import Path

PROGRAM = sys.argv[1]
SERVER = os.environ.get("VESPFLEET_TEST_SERVER")
DAY = 20000


def run(*words, status=0, data=None):
    done = subprocess.run([PROGRAM, *map(str, words)], input=data, capture_output=True)
    assert done.returncode == status, (words, done.returncode, done.stderr)
    assert (status == 0) == (not done.stderr), done.stderr
    run.errors = done.stderr.decode()
    return done.stdout.decode()


def ask(*words, data=None):
    found = [json.loads(line) for line in run(*words, "--json", data=data).splitlines()]
    for entry in found:
        assert fits(entry, SCHEMAS[words[0]]), (words, entry)
    return found


SCHEMAS = json.loads((Path(__file__).parents[2] / "docs/schemas/vespfleet.json").read_text())["$defs"]
TYPES = {"object": dict, "string": str, "integer": int, "number": (int, float), "null": type(None)}


def fits(value, schema):
    """The part of JSON Schema that these schemas use."""
    types = schema.get("type", [])
    types = [types] if isinstance(types, str) else types
    if types and not any(isinstance(value, TYPES[name]) and not isinstance(value, bool) for name in types):
        return False
    if value != schema.get("const", value) or value not in schema.get("enum", [value]):
        return False
    if not isinstance(value, dict):
        return value is None or value >= schema["minimum"] if "minimum" in schema else True
    known, rest = schema.get("properties", {}), schema.get("additionalProperties", True)
    return set(schema.get("required", [])) <= set(value) and all(
        fits(value[name], known.get(name, rest)) if isinstance(known.get(name, rest), dict) else rest for name in value)


def line(device, day=DAY, revision=1, created=0, build="A", scalars=None, distributions=None, histograms=None):
    return json.dumps({
        "version": 2, "device": device, "day": day, "revision": revision,
        "created": {"date": f"2026-01-01T00:00:{created:02}Z"}, "build": build, "model": None,
        "whitelist": "w", "scalars": scalars or {}, "distributions": distributions or {},
        "histograms": histograms or {}})


class Model:
    """What a store holds of these lines, and what it answers."""

    def __init__(self, lines, least=5):
        self.least = least
        self.current = {}
        self.counts = dict.fromkeys(("new", "replaced", "repeated", "older"), 0)
        for text in lines:
            entry = json.loads(text)
            rank = (entry["revision"], entry["created"]["date"], hashlib.sha256(text.encode()).digest())
            at = (entry["day"], entry["device"])
            known = self.current.get(at, (rank,))[0]
            self.counts["new" if at not in self.current else "replaced" if known < rank else
                        "older" if known > rank else "repeated"] += 1
            if at not in self.current or known < rank:
                self.current[at] = (rank, entry)

    def values(self, key, kind, by, total):
        groups = defaultdict(list)
        for (day, device), (_, entry) in self.current.items():
            if key in entry[kind]:
                groups[(0 if total else day, entry[by] if by else None)].append((device, day, entry))
        return sorted(groups.items(), key=lambda group: (group[0][0], group[0][1] or ""))

    def begin(self, group, members, by, total):
        days = [day for _, day, _ in members]
        found = {"from": min(days), "to": max(days), "deviceDays": len(days)} if total else {"day": days[0]}
        if by:
            found[by] = group[1]
        found["devices"] = len({device for device, _, _ in members})
        return found

    def scalar(self, key, by=None, total=False):
        for group, members in self.values(key, "scalars", by, total):
            found = self.begin(group, members, by, total)
            if found["devices"] >= self.least:
                values = sorted((entry["scalars"][key], device) for device, _, entry in members)
                found["mean"] = float(Fraction(sum(v for v, _ in values), len(values)))
                found["quantiles"] = {}
                for percent in (5, 25, 50, 75, 95):
                    value = values[-(-percent * len(values) // 100) - 1][0]
                    sides = ({d for v, d in values if v <= value}, {d for v, d in values if v >= value})
                    enough = min(map(len, sides)) >= self.least
                    found["quantiles"][str(percent / 100)] = value if enough else None
            yield found

    def distribution(self, key, by=None, total=False):
        for group, members in self.values(key, "distributions", by, total):
            found = self.begin(group, members, by, total)
            if found["devices"] >= self.least:
                parts = [entry["distributions"][key] for _, _, entry in members]
                count = sum(part[4] for part in parts)
                mean = sum(Fraction(part[2]) * part[4] for part in parts) / count
                deviations = sum(Fraction(part[3]) + part[4] * (Fraction(part[2]) - mean) ** 2 for part in parts)
                found["statistics"] = {"count": count, "mean": float(mean), "deviations": float(deviations)}
                having = defaultdict(set)
                counts = defaultdict(int)
                all_with = set()
                for device, _, entry in members:
                    for label, number in entry["histograms"].get(key, {}).items():
                        having[label].add(device)
                        counts[label] += number
                    if key in entry["histograms"]:
                        all_with.add(device)
                found["histogram"] = None if len(all_with) < self.least else {
                    label: counts[label] for label in counts if len(having[label]) >= self.least}
                if found["histogram"] and "(0, 2]" in found["histogram"] and len(found["histogram"]) > 1:
                    found["overlaps"] = True
            yield found

    def keys(self):
        found = defaultdict(lambda: (set(), set()))
        for (day, device), (_, entry) in self.current.items():
            for kind in ("scalars", "distributions"):
                for key in entry[kind]:
                    found[(key.encode(), kind)][0].add(device)
                    found[(key.encode(), kind)][1].add(day)
        for (key, kind), (devices, days) in sorted(found.items(), key=lambda i: (i[0][0], i[0][1] != "scalars")):
            if len(devices) >= self.least:
                yield {"key": key.decode(), "kind": kind[:-1], "devices": len(devices), "days": len(days)}

    def compare(self, a, b):
        means = defaultdict(lambda: ({}, {}))
        for (_, device), (_, entry) in self.current.items():
            if entry["build"] in (a, b):
                side = 0 if entry["build"] == a else 1
                for key, value in entry["scalars"].items():
                    means[(key, "scalar")][side].setdefault(device, []).append((value, 1))
                for key, value in entry["distributions"].items():
                    means[(key, "distribution")][side].setdefault(device, []).append((value[2], value[4]))
        rows = []
        for (key, kind), sides in means.items():
            if min(map(len, sides)) < self.least:
                continue
            groups = [[float(sum(Fraction(v) * n for v, n in of) / sum(n for _, n in of)) for of in side.values()]
                      for side in sides]
            n, m = map(len, groups)
            mean = [math.fsum(group) / len(group) for group in groups]
            x, y = (math.fsum((v - mean[i]) ** 2 for v in groups[i]) / (len(groups[i]) - 1) / len(groups[i])
                    for i in (0, 1))
            if x + y == 0:
                p = float(mean[0] == mean[1])
            else:
                p = student(abs(mean[1] - mean[0]) / math.sqrt(x + y),
                            (x + y) ** 2 / (x * x / (n - 1) + y * y / (m - 1)))
            rows.append({"key": key, "kind": kind, "devicesA": n, "devicesB": m, "meanA": mean[0], "meanB": mean[1],
                         "difference": mean[1] - mean[0],
                         "relative": (mean[1] - mean[0]) / abs(mean[0]) if mean[0] else None, "p": p})
        rows.sort(key=lambda row: (row["p"], row["key"], row["kind"] != "scalar"))
        for rank, row in enumerate(rows):
            row["q"] = min(later["p"] * len(rows) / (at + 1) for at, later in enumerate(rows) if at >= rank)
        return rows


def student(t, freedom):
    """Two-sided probability of Student's distribution: its density summed up by Simpson's rule."""
    scale = math.exp(math.lgamma((freedom + 1) / 2) - math.lgamma(freedom / 2)) / math.sqrt(freedom * math.pi)
    steps = 20000
    height = [scale * (1 + (t * i / steps) ** 2 / freedom) ** (-(freedom + 1) / 2) for i in range(steps + 1)]
    inside = (height[0] + height[-1] + 4 * sum(height[1:-1:2]) + 2 * sum(height[2:-1:2])) * t / steps / 3
    return max(0.0, 1 - 2 * inside)


def assert_same(found, expected, at=""):
    """Equal, numbers with a fraction but for rounding."""
    if isinstance(expected, float):
        assert math.isclose(found, expected, rel_tol=1e-9, abs_tol=1e-9), (at, found, expected)
    elif isinstance(expected, dict):
        assert isinstance(found, dict) and list(found) == list(expected) or sorted(found) == sorted(expected), \
            (at, found, expected)
        for name in expected:
            assert_same(found[name], expected[name], f"{at}.{name}")
    elif isinstance(expected, list):
        assert len(found) == len(expected), (at, found, expected)
        for i, element in enumerate(expected):
            assert_same(found[i], element, f"{at}[{i}]")
    else:
        assert found == expected, (at, found, expected)


def assert_answers(store, model):
    assert_same(ask("keys", store), list(model.keys()), "keys")
    for by in (None, "build"):
        for total in (False, True):
            options = (["--by", by] if by else []) + (["--total"] if total else [])
            for kind, key in (("scalar", "a"), ("scalar", "b"), ("distribution", "d")):
                assert_same(ask(kind, store, key, *options), list(getattr(model, kind)(key, by, total)),
                            f"{kind} {key} {options}")
    assert ask("scalar", store, "b", "--least", 1) == ask("scalar", store, "b")
    assert_same(ask("scalar", store, "b", "--by", "whitelist"), list(model.scalar("b", "whitelist")), "whitelist")
    assert_same(ask("compare", store, "A", "B", "--by", "build"), model.compare("A", "B"), "compare")
    assert run("complete", "--", "compare", store, "--by", "build", "").split()[:2] == ["A", "B"]


def some_lines(chance, devices=40, days=3):
    lines = []
    for day in range(DAY, DAY + days):
        for device in range(devices):
            for revision in range(1, chance.choice((2, 2, 3))):
                for _ in range(chance.choice((1, 1, 2))):  # of one revision and moment: the digest decides
                    scalars = {"a": chance.choice((-2**63, 2**63 - 1, chance.randrange(9))), "b": device // 4}
                    if chance.random() < 0.1:
                        scalars = {"only." + str(device): 1}
                    build = {0: None, 39: "only.39"}.get(device, chance.choice("AAAABBBBBC"))
                    if build == "A" or device < 4:
                        scalars["few of B"] = device
                    lines.append(line(f"D{device}", day, revision, chance.randrange(2), build, scalars,
                                      {"d": [0, 9, chance.randrange(90) / 7, chance.random(), chance.randrange(1, 99)],
                                       "e": [{"float": 0.25}, 0, 1.5, 0, 7]},
                                      {"d": {chance.choice(("(-inf, 1]", "(0, 2]", "(1, inf)")): chance.randrange(2**40)}}
                                      if chance.random() < 0.6 else {}))
    return lines


def test_answers(store, folder, chance):
    lines = some_lines(chance)
    history = []
    every = lines
    chance.shuffle(every)
    for attempt in range(3):
        lines = every[:len(every) * (attempt + 1) // 3]
        chance.shuffle(lines)
        half = len(lines) // 2 + attempt
        if "://" in store and attempt:  # the second time, replaced lines stay beside those that replace them
            post(f"SYSTEM {'STOP' if attempt == 1 else 'START'} MERGES {store.split('/')[-1]}.vespfleet_report")
        (folder / "in").mkdir(exist_ok=True)
        (folder / "in/1.jsonl").write_text("\n".join(lines[:half]) + "\n")
        packed = gzip.compress((lines[half] + "\n").encode()) + gzip.compress("\n".join(lines[half + 1:]).encode())
        (folder / "in/2.jsonl.gz").write_bytes(packed)
        counts = ask("load", store, folder / "in")[0]
        before, after = Model(history).counts, Model(history + lines).counts
        assert_same({name: counts[name] for name in after}, {name: after[name] - before[name] for name in after}, "load")
        history += lines
        model = Model(lines)
        assert_answers(store, model)
    rows = run("dump", store, "--key", "a", "--to", DAY).splitlines()
    expected = {f"{device},{day},2024-10-04,{entry['revision']},{entry['build'] or ''},,scalar,a,value,"
                f"{entry['scalars']['a']}" for (day, device), (_, entry) in model.current.items()
                if day == DAY and "a" in entry["scalars"]}
    assert rows[0] == "device,day,date,revision,build,model,kind,key,field,value" and set(rows[1:]) == expected
    last, builds = defaultdict(int), defaultdict(int)
    for device in {device for _, device in model.current}:
        day = max(day for day, of in model.current if of == device)
        last[day] += 1
        builds[(day, model.current[(day, device)][1]["build"])] += 1
    assert ask("devices", store) == [{"day": day, "devices": last[day]} for day in sorted(last)]
    assert ask("devices", store, "--by", "build") == [
        {"day": day, "build": build, "devices": builds[(day, build)]}
        for day, build in sorted(builds, key=lambda group: (group[0], group[1] or ""))]

    for words in (("scalar", store, "d"), ("distribution", store, "no"), ("compare", store, "A", "Z", "--by", "build"),
                  ("load", store, "--least", "4", "/dev/null")):
        run(*words, status=1)
        assert run.errors.count("\n") == 1, run.errors
    for words in (("compare", store, "A", "A", "--by", "build"), ("load", store, "--least", "2", "/dev/null"),
                  ("keys", "ftp://x/y"), ("keys", "http://u:p@127.0.0.1:1/x")):
        run(*words, status=2)

    assert ask("forget", store, "D3", "D39")[0]["devices"] == 2
    lines = [text for text in lines if json.loads(text)["device"] not in ("D3", "D39")]
    if "://" not in store:
        run("load", store, "-", data=line("a device to be forgotten").encode())
        ask("forget", store, "a device to be forgotten")
        assert b"to be forgotten" not in Path(store).read_bytes()
    assert_answers(store, Model(lines))
    # The newest days have a single device, or a wrong clock.
    lines += [line("D7", DAY + 3)] + [line(f"D{device}", 84005) for device in range(10, 16)]
    run("load", store, "-", data="\n".join(lines).encode())
    assert ask("prune", store, "--days", 1)[0]["firstDay"] == DAY + 1
    for again in (line("D3", DAY + 2, scalars={"a": 1}), line("D8", DAY, scalars={"a": 1})):
        assert "0 malformed, 1 refused" in run("load", store, "-", data=again.encode())
    lines.append(line("first", DAY + 1, scalars={"a": 1}))
    assert " 1 new" in run("load", store, "-", data=lines[-1].encode())
    assert_answers(store, Model([text for text in lines if json.loads(text)["day"] > DAY]))
    if "://" in store:
        rows = post(f"SELECT count() - uniqExact(day, device) FROM {store.split('/')[-1]}.vespfleet_report")
        assert int(rows) == 0, "replaced lines stay after merging"
    else:
        held = Path(store).read_bytes()
        assert b"D39" not in held and b"only.39" not in held, "what a device sent is still in the file"


def test_malformed(store, folder, _):
    good = json.loads(line("D", scalars={"a": 1}, distributions={"d": [0, 1, 1, 0, 0], "i": [{"real": "inf"}, 1, 1, 0, 1]}))
    bad = [b"", b"[]", b"{", json.dumps(dict(good, more=1)).encode(), json.dumps(good)[:-1].encode() + b',"day":1}',
           b" " * (16 << 20) + json.dumps(good).encode()]
    for name, value in (("version", 1), ("device", ""), ("device", "x" * 256), ("device", "\x01"), ("day", -1),
                        ("day", 84006), ("revision", 0), ("revision", 2**31), ("build", 5), ("created", "x"),
                        ("scalars", {"": 1}), ("scalars", {"k" * 1025: 1}), ("scalars", {"a": 2**63}),
                        ("scalars", {"a": 1.0}), ("scalars", {"a": None}),
                        ("scalars", {str(i): 1 for i in range(20000)}), ("distributions", {"d": [0, 0, 0, 0, -1]}),
                        ("distributions", {"d": [0, 0, 0, 0, 2**31]}), ("distributions", {"d": [0, 0, 0, None, 1]}),
                        ("histograms", {"d": {"x": 2**63}}), ("histograms", {"d": {"x": -1}})):
        bad.append(json.dumps(dict(good, **{name: value})).encode())
    reasons = {}
    for name, value, why in (("more", "[" * 200 + "]" * 200, "not JSON"), ("more", "[" * 199 + "]" * 199, "an entry that"),
                             ("more", '[{"a":1,"b":{},"a":1}]', "not JSON"), ("day", "1e999", "not JSON"),
                             ("device", '"\\ud800"', "not JSON"), ("created", '{"date":null}', "a null"),
                             ("created", '{"date":"2026-01-01T00:00:00Z","x":1}', "a creation"),
                             ("created", '{"data":""}', "a creation"), ("distributions", '{"d":[1,1,1,1,true]}', "a count"),
                             ("distributions", '{"d":[1,1,1,"x",1]}', "a distribution that"),
                             ("distributions", '{"d":[1,1,1,{"float":1},{"float":1}]}', "a count")):
        bad.append(json.dumps(dict(good, **{name: "@"})).replace('"@"', value).encode())
        reasons[len(bad)] = why
    bad.append(json.dumps(good).encode() + b"\0")
    spool = folder / "spool"
    (spool / "D").mkdir(parents=True)
    (spool / "D/good.jsonl").write_text("\ufeff" + json.dumps(good))
    (spool / "D/other.jsonl").write_text(line("E", scalars={"a": 2}))
    (spool / "cut.jsonl.gz").write_bytes(gzip.compress(("\n".join([line("F", scalars={"a": 3})] * 99)).encode())[:-9])
    (spool / "bad.jsonl").write_bytes(b"\n".join(bad) + b"\n" + line("G", scalars={"a": 4}).encode())
    os.mkfifo(spool / "fifo.jsonl")
    run("load", store, "--spool", spool, status=1)
    errors = run.errors.splitlines()
    assert len(errors) == len(bad) + 2 and "D" * 9 not in run.errors, run.errors
    assert [f"{spool}/bad.jsonl:{i + 1}" for i in range(len(bad))] == [
        error.split(": ")[0] for error in errors if "bad.jsonl" in error]
    for number, why in reasons.items():
        assert f"bad.jsonl:{number}: {why}" in run.errors, (number, why)
    left = sorted(str(path.relative_to(spool)) for path in spool.rglob("*") if not path.is_dir())
    assert left == ["D/rejected/other.jsonl", "fifo.jsonl", "rejected/bad.jsonl", "rejected/cut.jsonl.gz"], left
    assert ask("scalar", store, "a")[0]["devices"] in (2, 3)
    assert run("keys", store) == "No key comes from 5 devices or more.\n"
    (spool / "D/good.jsonl").write_text(json.dumps(good))
    (spool / "bad.jsonl").write_text("x")
    load = subprocess.Popen([PROGRAM, "load", store, "--spool", spool, "-"], stdin=subprocess.PIPE,
                            stdout=subprocess.DEVNULL, stderr=subprocess.PIPE, bufsize=0)
    assert b"bad.jsonl:1" in load.stderr.readline()  # the folder is read
    (spool / "D/good.jsonl").write_text(json.dumps(good) * 2)
    load.communicate()
    assert (spool / "D/good.jsonl").exists() and (spool / "rejected/bad.jsonl.1").exists(), "what came since is lost"
    run("distribution", store, "d", status=1)
    run("distribution", store, "i", status=1)


def test_kills(store, folder, chance):
    lines = []
    for revision in range(1, 30):
        for device in range(20):
            value = revision * 1000 + device
            lines.append(line(f"D{device}", DAY, revision, 0, "AB"[device % 2], {"a": value, f"b{value}": 1},
                              {"d": [1, 2, 1.5, 0.5, value]}, {"d": {"x": value}}))
    (folder / "all.jsonl").write_text("\n".join(lines))
    run("load", store, "-", data=lines[0].encode())
    for delay in (0, 0.01, 0.03, 0.1):
        child = subprocess.Popen([PROGRAM, "load", store, folder / "all.jsonl"], stdout=subprocess.DEVNULL)
        time.sleep(delay)
        child.send_signal(signal.SIGKILL)
        child.wait()
        for answer in ask("scalar", store, "a", "--total") if delay else []:
            assert answer["deviceDays"] == answer["devices"]
    loads = []
    for more in range(2):  # of one rank but for the digest
        rivals = [line(f"D{device}", DAY, 30, 0, "AB"[device % 2], {"a": 2 * device + more},
                       {"d": [1, 2, 1.5, 0.5, device + 1]}) for device in range(20)]
        (folder / f"{more}.jsonl").write_text("\n".join(lines[:580] + rivals))
        lines += rivals
        loads.append(subprocess.Popen([PROGRAM, "load", store, folder / f"{more}.jsonl"], stdout=subprocess.DEVNULL))
    assert [load.wait() for load in loads] == [0, 0]
    mixed = [line(device, day, revision) for revision in (1, 2) for day in (DAY, DAY + 1)
             for device in ("F", "a long name", "a long name 2")]
    counts = ask("load", store, "-", data="\n".join(mixed).encode())[0]
    assert counts["new"] == counts["replaced"] == 6, counts
    for some in (range(600), range(600, 900)):  # more than a chunk holds
        lines += [line(f"E{device}", DAY + 1, distributions={"d": [1, 2, 1.5, 0.5, device + 1]}) for device in some]
        run("load", store, "-", data="\n".join(lines[-len(some):]).encode())
    model = Model(lines)
    assert_same(ask("keys", store), list(model.keys()))
    assert_same(ask("scalar", store, "a"), list(model.scalar("a")))
    assert_same(ask("distribution", store, "d", "--by", "build"), list(model.distribution("d", "build")))
    if "://" not in store:
        replaced = sqlite3.connect(store).execute("SELECT total(lines) FROM replaced").fetchone()[0]
        assert replaced <= 20, "replaced values stay"


def test_refused_stores(store, folder, _):
    if "://" in store:
        return
    (folder / "lines").write_text(line("D", scalars={"a": 1}))
    run("load", folder / "fleet.db", folder / "lines")
    assert (folder / "fleet.db").stat().st_mode & 0o777 == 0o600
    for name, change in (("other", "CREATE TABLE line(x)"), ("more", None), ("notes", b"nothing"), ("empty", b"")):
        path = folder / name
        if isinstance(change, bytes):
            path.write_bytes(change)
        else:
            if change is None:
                path.write_bytes((folder / "fleet.db").read_bytes())
                change = ("ALTER TABLE rule RENAME TO old; CREATE VIEW rule AS WITH RECURSIVE n(least, first_day) AS"
                          " (SELECT 5, 0 UNION ALL SELECT least + 1, 0 FROM n) SELECT * FROM n WHERE least < 0")
            subprocess.run(["sqlite3", path, change], check=True)
        held = path.read_bytes()
        for words in (("load", path, folder / "lines"), ("keys", path)):
            run(*words, status=1)
            assert run.errors == f"vespfleet {words[0]}: {path}: no fleet store\n", run.errors
        assert path.read_bytes() == held
    run("keys", folder / "none", status=1)


def test_page(store, folder, chance):
    run("load", store, "/dev/null")
    assert "No key is reported" in run("page", store)
    lines = []
    for back in range(20):
        for number in range(24):
            values = {"jump": (900 if back == 0 else 100) + chance.randint(-5, 5), "calm": chance.randint(90, 110),
                      "<script>": 1, "linux.memory.pagedInKiB": 4096}
            build = "2<b>" if number % 2 and back < 9 else "1"
            values["slower"] = chance.randint(90, 110) * (3 if build == "2<b>" else 1)
            if number < 4:
                values["rare"] = 7
            if number > 20 and back < 10:
                continue  # stopped
            lines.append(line(f"D{number}", DAY - back, build=build, scalars=values,
                              distributions={"d": [1, 9, chance.uniform(4, 5), 2, 30]}))
    run("load", store, "-", data="\n".join(lines).encode())
    page = run("page", store, "--title", "Our <phones>")
    changed, builds, keys, devices = page.split("</section>")[:4]
    assert "<bdi>Our &lt;phones&gt;</bdi>" in changed and "3 devices stopped" in changed
    assert changed.count("<li ") == 2 and "<bdi>jump</bdi>" in changed, changed
    assert builds.index("<bdi>slower</bdi>") < builds.index("<bdi>calm</bdi>") and "2&lt;b&gt;" in builds
    assert "4\u202fMiB" in keys and "<bdi>&lt;script&gt;</bdi>" in keys and "<bdi>d</bdi>" in keys
    assert "rare" not in page and page.count("<script>") == 1
    run("page", store, folder / "page")
    assert (folder / "page").stat().st_mode & 0o777 == 0o600 and run("page", store) == (folder / "page").read_text()


EARLIER = {"vespfleet_scalar": "key String, day Int32, device String, line UInt64, value Int64",
           "vespfleet_distribution":
               "key String, day Int32, device String, line UInt64, minimum Float64, maximum Float64, mean Float64,"
               " deviations Float64, count Int64, hasHistogram UInt8, labels Array(String), counts Array(UInt64)",
           "vespfleet_line": "day Int32, device String, revision Int64, seconds Int64, nanoseconds UInt32, line UInt64,"
                             " text String"}
EARLIER_FILE = """PRAGMA application_id = 0x76666C74; PRAGMA user_version = 1;
  CREATE TABLE device(number INTEGER PRIMARY KEY, name TEXT NOT NULL UNIQUE) STRICT;
  CREATE TABLE key(number INTEGER PRIMARY KEY, kind INTEGER NOT NULL, name TEXT NOT NULL,
                   UNIQUE(name, kind)) STRICT;
  CREATE TABLE label(number INTEGER PRIMARY KEY, name TEXT NOT NULL UNIQUE) STRICT;
  CREATE TABLE line(number INTEGER PRIMARY KEY AUTOINCREMENT, day INTEGER NOT NULL,
                    device INTEGER NOT NULL, revision INTEGER NOT NULL, seconds INTEGER NOT NULL,
                    nanoseconds INTEGER NOT NULL, size INTEGER NOT NULL, text BLOB NOT NULL,
                    UNIQUE(day, device)) STRICT;
  CREATE TABLE chunk(number INTEGER PRIMARY KEY, last INTEGER NOT NULL, entries BLOB NOT NULL)
    STRICT;
  CREATE TABLE replaced(lines INTEGER NOT NULL) STRICT;"""


def test_earlier_version(store, folder, chance):
    texts = []
    for text in some_lines(chance, devices=9, days=1) + [line("long", scalars={"k" * 1025: 1})]:
        entry = json.loads(text)
        del entry["build"], entry["model"]
        texts.append(json.dumps(dict(entry, version=1)))
    if "://" in store:
        at = store.split("/")[-1] + "."
        for name, columns in EARLIER.items():
            post(f"CREATE TABLE {at}{name} ({columns}) ENGINE = MergeTree PARTITION BY day ORDER BY day")
        post(f"INSERT INTO {at}vespfleet_line FORMAT JSONEachRow " + json.dumps({"text": "one"})
             + "".join(json.dumps({"text": text}) for text in texts))
    else:
        database = sqlite3.connect(store)
        database.executescript(EARLIER_FILE)
        for number, text in enumerate(texts + ["one"]):
            database.execute("INSERT INTO line VALUES(?, ?, 0, 0, 0, 0, ?, ?)",
                             (number + 1, number, len(text), zlib.compress(text.encode())))
        database.commit()
        database.close()
    run("keys", store, status=1)
    assert run.errors.count("\n") == 1, run.errors
    load = subprocess.run([PROGRAM, "load", store, "-"], input=b"", capture_output=True, check=True)
    assert load.stderr.count(b"earlier version is dropped") == 2, load.stderr
    model = Model(json.dumps(dict(json.loads(text), build=None)) for text in texts[:-1])
    for (day, device), (_, entry) in model.current.items():  # the digest is that of the earlier text
        rivals = [text for text in texts[:-1] if json.loads(text)["device"] == device]
        model.current[(day, device)] = (None, dict(json.loads(max(rivals, key=lambda text: (
            json.loads(text)["revision"], json.loads(text)["created"]["date"],
            hashlib.sha256(text.encode()).digest()))), build=None))
    assert_same(ask("keys", store), list(model.keys()), "keys")
    assert_same(ask("scalar", store, "a", "--by", "build"), list(model.scalar("a", "build")), "scalar")
    assert_same(ask("distribution", store, "d"), list(model.distribution("d")), "distribution")


def test_encrypted(store, folder, _):
    if "://" not in store:
        return
    subprocess.run(["openssl", "req", "-x509", "-newkey", "rsa:2048", "-nodes", "-keyout", folder / "key", "-out",
                    folder / "ca", "-days", "2", "-subj", "/CN=here", "-addext", "subjectAltName=IP:127.0.0.1"],
                   check=True, capture_output=True)
    seen, lie = [], lambda answer: (200, answer)

    class Front(http.server.BaseHTTPRequestHandler):
        def do_POST(self):
            seen.append(self.headers["Authorization"])
            body = self.rfile.read(int(self.headers["Content-Length"]))
            answer = urllib.request.urlopen(urllib.request.Request(
                SERVER + self.path, body, {"Content-Type": self.headers["Content-Type"]})).read()
            status, answer = lie(answer)
            self.send_response(status)
            self.send_header("Content-Length", str(len(answer)))
            self.end_headers()
            self.wfile.write(answer)

        def log_message(self, *_):
            pass

    front = http.server.ThreadingHTTPServer(("127.0.0.1", 0), Front)
    context = ssl.SSLContext(ssl.PROTOCOL_TLS_SERVER)
    context.load_cert_chain(folder / "ca", folder / "key")
    front.socket = context.wrap_socket(front.socket, server_side=True)
    threading.Thread(target=front.serve_forever, daemon=True).start()
    address = f"https://127.0.0.1:{front.server_port}/{store.split('/')[-1]}"
    (folder / "who").write_text("user:pass:word\n")
    run("load", address, "/dev/null", status=1)  # nobody vouches for the certificate
    os.environ.update(VESPFLEET_CA=str(folder / "ca"), VESPFLEET_CREDENTIALS=str(folder / "who"))
    (folder / "who").chmod(0o640)
    run("load", address, "/dev/null", status=1)  # others can read it
    assert not seen
    (folder / "who").chmod(0o600)
    run("load", address, "-", data="\n".join(line(f"D{i}", scalars={"a": 1}) for i in range(5)).encode())
    assert ask("keys", address)[0]["devices"] == 5
    unique = store.split("/")[-1] + ".vespfleet_unique"
    post(f"TRUNCATE TABLE {unique}")  # as after a kill
    run("load", address, "-", data=line("D0", scalars={"a": 1}).encode())
    assert post(f"SELECT lines FROM {unique}") == "5\n", "a week without a line twice is merged in vain"
    assert set(seen) == {"Basic " + base64.b64encode(b"user:pass:word").decode()}, seen
    arriving = iter([line(f"E{i}", scalars=dict.fromkeys("bcde", 1)).encode() for i in range(16)])

    def lie(answer):  # a line more after each answer
        if data := next(arriving, None):
            subprocess.run([PROGRAM, "load", store, "-"], input=data, env={}, stdout=subprocess.DEVNULL, check=True)
        return 200, answer

    assert {key["devices"] for key in ask("keys", address) if key["key"] != "a"} == {16}, "parts of lines"
    for lie, why in ((lambda answer: (200, answer[:-1]), "the server's answer is cut"),
                     (lambda answer: (200, b""), "the server's answer is empty"),
                     (lambda answer: (200, b"\xff" * (129 << 20)), "the server's answer does not fit the question"),
                     (lambda answer: (302, b""), "status 302")):
        run("keys", address, status=1)
        assert run.errors == f"vespfleet keys: {address}: {why}\n", run.errors
    del os.environ["VESPFLEET_CA"], os.environ["VESPFLEET_CREDENTIALS"]
    front.shutdown()


def post(statement):
    return urllib.request.urlopen(SERVER, statement.encode()).read().decode()


def main():
    chance = random.Random(7)
    for name, test in sorted(globals().items()):
        if not name.startswith("test_") or sys.argv[2:] not in ([], [name]):
            continue
        with tempfile.TemporaryDirectory() as folder:
            test(f"{folder}/store", Path(folder), chance)
        if SERVER:
            post(f"DROP DATABASE IF EXISTS {name}")
            post(f"CREATE DATABASE {name}")
            with tempfile.TemporaryDirectory() as folder:
                test(f"{SERVER}/{name}", Path(folder), chance)
        print(name, "passed")


main()
