#!/usr/bin/env python3
"""Holds what every command of the vespctl in argv[1] prints with --json against its schema."""
import json, os, pathlib, re, struct, subprocess, sys, tempfile
import jsonschema

vespctl = os.path.abspath(sys.argv[1])
root = pathlib.Path(__file__).parents[2]
schemas = {path.stem: json.loads(path.read_text()) for path in (root / "docs/schemas").iterdir()
           if path.stem != "vespfleet"}
store = {schema["$id"]: schema for schema in schemas.values()}
folder = tempfile.TemporaryDirectory()
os.chdir(folder.name)
os.environ["VESPRUN_DEVICE"] = "device"


def run(words, statuses=(0, 1)):
    done = subprocess.run([vespctl, *words.split()], capture_output=True, text=True, check=False)
    assert done.returncode in statuses, (words, done)
    return done.stdout


WHITELIST = """<ptree version="1.0"><dict><key>G</key><dict>
<key>About</key><dict><key>owner</key><string>o</string><key>expires</key><date>2024-03-04T00:00:00Z</date></dict>
<key>ScalarKeys</key><dict><key>a</key><dict><key>sig_fig</key><integer>%d</integer></dict><key>bad</key><true/></dict>
<key>DistributionKeyPrefixes</key><dict><key>d.</key><dict><key>intervals</key><array><real>%d.5</real><real>inf</real></array></dict>
</dict></dict></dict></ptree>"""
for name, number in ("old", 1), ("new", 2):
    pathlib.Path(name).write_text(WHITELIST % (number, number))
pathlib.Path("empty").write_text('<ptree version="1.0"><dict/></ptree>')
pathlib.Path("words").write_bytes(bytes(4096))
run("init device --sample", (0,))
for day in ("--day=yesterday", "--day=today"):
    run(f"counters add a 17 {day}")
    run(f"counters sample d.x {day} -- 1 -inf nan")
run("run -- -d")
run("collect")
run("prefs set some.domain k {\"a\":[1,2.5,true,{\"real\":\"nan\"}]}")

base = "device/controller/telemetry-0.bin"
lines = {"show", "days", "whitelist-list", "counters-get"}
checks = {
    "status": ["status"],
    "show": ["show"],
    "days": ["days"],
    "catch-up": ["counters add a 1 --day 3", "catch-up --last 99999 --dry-run"],
    "prune": ["prune --counters 3 --outbox 0 --outbox-size 0 --dry-run"],
    "upload": ["upload http://127.0.0.1:1/"],
    "preview": ["preview", "preview --day 0"],
    "preview-left-out": ["preview --left-out"],
    "explain": ["explain a", "explain d.x --kind distribution", "explain a --kind scalar"],
    "whitelist-check": ["whitelist check", "whitelist check old --require reason"],
    "whitelist-list": ["whitelist list", "whitelist list old"],
    "whitelist-diff": ["whitelist diff old", "whitelist install old --force", "whitelist diff new"],
    "whitelist-diff-documents": ["whitelist diff old new", "whitelist diff empty new"],
    "counters-get": ["counters get *"],
    "prefs-get": ["prefs get some.domain", "prefs get some.domain k", "prefs get none"],
    "nand": [],
    "decode-fields": [f"decode {layout} {base}" for layout in ("base", "ftl", "ftl-keys", "msp")],
    "decode-words": ["decode counters-generic words"],
    "decode-snapshot": ["decode snapshot --thread worker device/kernel/snapshot.bin"],
    "decode-differences": [f"decode base {base} words"],
    "property-value": [],
}
silent = {"init", "run", "collect", "listen", "counters set", "counters add", "counters sample",
          "counters import", "prefs set", "prefs remove", "send logging",
          "send apps", "send session", "send daily", "send raw"}

manual = run(f"manual {root}/tools/vespctl/manual.md", (0,))
with_json = {re.split(r" \[?[-A-Z]", usage)[0]
             for usage in re.findall(r"^`vespctl (.*) \[--json\]`$", manual, re.M)}
nand = sorted(words for words in with_json if words.startswith("nand "))
checks["nand"] = [words + (" 24" if words == "nand magazine" else "") for words in nand]
assert len(nand) > 15, nand
assert set(checks) == set(schemas), set(checks) ^ set(schemas)
seen = set()
for name, commands in checks.items():
    validator = jsonschema.Draft202012Validator(
        schemas[name], resolver=jsonschema.RefResolver("", schemas[name], store))
    validator.check_schema(schemas[name])
    for words in commands:
        printed = run(words + " --json").splitlines()
        assert name in lines or len(printed) == 1 or words.startswith("counters add"), (words, printed)
        for line in printed:
            validator.validate(json.loads(line))
        seen.add(words)
# Fields are compared by name and place: 7 twice, of which the second differs, and 9 in one alone.
def records(*pairs):
    return b"".join(struct.pack("<IIQ", key, 1, value) for key, value in pairs)


pathlib.Path("before").write_bytes(records((7, 1), (7, 2), (8, 5)))
pathlib.Path("after").write_bytes(records((7, 1), (9, 6), (7, 3)) + b"\xff\xff\0\0\1\0\0\0rest")
assert json.loads(run("decode ftl-keys before after --json", (0,))) == [
    {"field": "Stat_7", "before": 2, "after": 3}, {"field": "Stat_8", "before": 5, "after": None},
    {"field": "Stat_9", "before": None, "after": 6}]
assert run("decode ftl-keys after").endswith(
    "Not decoded of 60 bytes: 12 bytes from offset 48 on: the records end there.\n")
assert run("decode ftl-keys before").endswith("All of the 48 bytes were decoded.\n")
pathlib.Path("msp").write_bytes(struct.pack("<HHQ", 4096, 8, 1))  # a record of one value
assert "Not decoded of 12 bytes: 4 bytes in 1 records" in run("decode msp msp")
for words in with_json - silent:
    assert any((known + " ").startswith(words + " ") for known in seen), words + " has no schema"
