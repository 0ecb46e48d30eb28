#!/usr/bin/env python3
"""Whitelist changes as engineers make them, judged from the output alone, and random ones against a
model of what an entry lets out.

  whitelist_changes.py VESPCTL
"""

import copy
import json
import math
import os
import random
import subprocess
import sys
import tempfile
import time
import unittest
from xml.sax.saxutils import escape

VESPCTL = os.path.abspath(sys.argv.pop(1))
LISTS = ["ScalarKeys", "ScalarKeyPrefixes", "DistributionKeys", "DistributionKeyPrefixes"]


def element(value):
    if isinstance(value, dict):
        entries = "".join(f"<key>{escape(k)}</key>\n{element(v)}\n" for k, v in value.items())
        return f"<dict>{entries}</dict>"
    if isinstance(value, list):
        return "<array>" + "".join(map(element, value)) + "</array>"
    if isinstance(value, bool):
        return "<true/>" if value else "<false/>"
    kind = {int: "integer", float: "real"}.get(type(value), "string")
    return f"<{kind}>{escape(str(value))}</{kind}>"


def write(name, groups, comment=""):
    with open(name, "w", encoding="utf-8") as file:
        file.write(f'<ptree version="1.0">{comment}\n{element(groups)}</ptree>\n')


def vespctl(*arguments):
    done = subprocess.run([VESPCTL, "-C", "device", *arguments], capture_output=True, check=False)
    return done.returncode, done.stdout.decode(), done.stderr.decode()


def run(*arguments):
    status, output, error = vespctl("whitelist", *arguments)
    assert not error, error
    return status, output


def read(name):
    with open(name, "rb") as file:
        return file.read()


def place(finding):
    return "/".join(str(finding[name]) for name in ["line", "group", "list", "key", "finding"])


def diff(*options):
    status, output = run("diff", "old", "new", "--exit-code", "--json", *options)
    return status, json.loads(output)


def changes(answer):
    """{"scalars keys a finer", ...}"""
    told = set()
    for kind, lists in answer.items():
        for where, by_change in lists.items():
            for change, entries in by_change.items():
                keys = [entry["key"] for entry in entries]
                assert keys == sorted(keys, key=str.encode)
                told |= {f"{kind} {where} {e['key']} {e.get('effect', change)}" for e in entries}
    return told


BASE = {
    "App": {
        "About": {"owner": "app team", "reason": "crashes"},
        "ScalarKeys": {"app.a": {"sig_fig": 3}, "app.b": {"bucket_interval": 10}, "app.c": {}},
        "ScalarKeyPrefixes": {"app.net.": {"sig_fig": 2}, "app.disk.": {"sig_fig": 1}},
        "DistributionKeys": {"app.d": {"intervals": [1, 2, 5.5, 10]}},
    },
    "InternalTesting": {"ScalarKeys": {"secret": {}}},
}


def rename(entries, old, new):
    entries[new] = entries.pop(old)


def swap_prefixes(app):
    app["ScalarKeyPrefixes"] = dict(reversed(app["ScalarKeyPrefixes"].items()))


# A change of the group, what it lets out, whether `check` finds anything, what people are told.
CHANGES = [
    (lambda a: a["ScalarKeyPrefixes"].update({"app.ui.": {}}),
     {"scalars prefixes app.ui. added"}, [], "Lets more out: 1 added."),
    (lambda a: rename(a["ScalarKeyPrefixes"], "app.net.", "app.net.wifi."),
     {"scalars prefixes app.net. removed", "scalars prefixes app.net.wifi. added"}, [],
     "Lets less out: 1 removed. Lets the same out: 1 added."),
    (lambda a: a["ScalarKeyPrefixes"].pop("app.net."),
     {"scalars prefixes app.net. removed"}, [], "Lets less out: 1 removed."),
    (lambda a: rename(a["ScalarKeyPrefixes"], "app.net.", "app.web."),
     {"scalars prefixes app.net. removed", "scalars prefixes app.web. added"}, [], "1 added"),
    (lambda a: a["ScalarKeys"].update({"app.a": {"sig_fig": 4}}),
     {"scalars keys app.a finer"}, [], "sig_fig 3"),
    (lambda a: a["ScalarKeys"].update({"app.a": {"sig_fig": 3, "bucket_interval": 100}}),
     {"scalars keys app.a coarser"}, [], "sig_fig 3, bucket_interval 100"),
    (lambda a: a["ScalarKeys"].update({"app.a": {"bucket_interval": 100}}),
     {"scalars keys app.a different"}, [], "Lets more out: 1 different."),
    (lambda a: a["DistributionKeys"].update({"app.d": {"intervals": [1.0, 10]}}),
     {"distributions keys app.d coarser"}, [], "intervals 1, 10"),
    (lambda a: a["DistributionKeys"].update({"app.d": {"intervals": [1, 2, 3, 5.5, 10]}}),
     {"distributions keys app.d finer"}, [], "intervals 1, 2, 3, 5.5, 10"),
    (lambda a: rename(a, "DistributionKeys", "DistributionKey"),
     {"distributions keys app.d removed"}, ["unknown list"], "1 removed"),
    (lambda a: a["ScalarKeys"].update({"app.a": {"sigfig": 3}}),
     {"scalars keys app.a finer"}, ["unread option"], "exactly as counted"),
    (lambda a: a["ScalarKeys"].update({"app.a": {"sig_fig": "3"}}),
     {"scalars keys app.a removed"}, ["unreadable options"], "held back, since its options cannot be read"),
    (lambda a: a["ScalarKeys"].update({"app.a": {"sig_fig": 3.0, "owner": "me"}}),
     set(), [], "No entry changes what leaves."),
    (lambda a: a["ScalarKeys"].update({f"app.k{i}": {"sig_fig": 1} for i in range(5000)}),
     {f"scalars keys app.k{i} added" for i in range(5000)}, [], "5,000 added"),
    (swap_prefixes, set(), [], "Scalars: The order of prefixes changed"),
    (lambda a: a["ScalarKeys"].update({"app.net.x": {"sig_fig": 1}}),
     {"scalars keys app.net.x added"}, [], "Lets less out: 1 added."),
    (lambda a: (a["ScalarKeyPrefixes"].pop("app.net."), a["ScalarKeyPrefixes"].update({"app.": {}})),
     {"scalars prefixes app. added", "scalars prefixes app.net. removed"}, ["same as its prefix", "broad prefix"],
     'no entry, covered by "app.": exactly as counted'),
    (lambda a: a["ScalarKeys"].pop("app.c"),
     {"scalars keys app.c removed"}, [], "Lets less out: 1 removed."),
]


class WhitelistChanges(unittest.TestCase):
    def test_changes_of_engineers(self):
        write("old", BASE)
        for change, told, findings, text in CHANGES:
            new = copy.deepcopy(BASE)
            change(new["App"])
            write("new", new, "<!-- why -->")
            status, answer = diff()
            self.assertEqual(changes(answer), told)
            harmless = all(entry.endswith((" coarser", " removed")) for entry in told)
            self.assertEqual(status, 0 if harmless else 3)
            status, found = run("check", "--json", "--require", "reason,owner", "new")
            self.assertEqual([f["finding"] for f in json.loads(found)], findings + ["missing metadata"])
            self.assertIn(text, run("diff", "old", "new")[1])
            self.assertIn(text.split('"')[0], run("diff", "old", "new", "--markdown")[1])
        new = copy.deepcopy(BASE)
        rename(new, "InternalTesting", "InternalTest")
        write("new", new)
        self.assertEqual(changes(diff()[1]), {"scalars keys secret added"})
        self.assertIn('switched off by its name: "InternalTest".', run("diff", "old", "new")[1])

    def test_every_fault(self):
        about = {"owner": 1, "reason": "r", "expires": "soon"}
        write("w", {"None": [], "Bad": {"About": 1}, "A": {
            "About": about, "Scalars": {},
            "ScalarKeys": {
                "held": True, "odd": {"bucket_interval": math.nan, "sig_fig": 1.5},
                "zero": {"bucket_interval": 0, "sig_fig": 0.0},
                "far": {"bucket_interval": -1, "sig_fig": True},
                "unread": {"intervals": [], "owner": "o", "expires": 2}, "p.same": {"sig_fig": 2.0},
                "p.other": {}, "again": {}, "tested": {}},
            "ScalarKeyPrefixes": {"p.": {"sig_fig": 2}, "p.x": {}, "t.x": {}, "com": {}},
            "DistributionKeys": True},
            "InternalTesting": {"ScalarKeys": {"tested": {}, "p.in": {"sig_fig": 2}},
                                "ScalarKeyPrefixes": {"t.": {}}},
            "B": {"ScalarKeys": {"again": {"sig_fig": 2}, "t.k": {}},
                  "DistributionKeys": {"e": {"sig_fig": 1}},
                  "DistributionKeyPrefixes": {"": {"intervals": [1.0, 1]}}}})
        status, output = run("check", "w", "--json")
        self.assertEqual(status, 1)
        self.assertEqual([place(f)[len(str(f["line"])) + 1:] for f in json.loads(output)], """
            None/None/None/wrong kind Bad/About/None/wrong metadata A/About/None/wrong metadata
            A/About/None/wrong metadata A/Scalars/None/unknown list
            A/ScalarKeys/held/unreadable options A/ScalarKeys/odd/doubtful number
            A/ScalarKeys/odd/doubtful number A/ScalarKeys/zero/interval is 0
            A/ScalarKeys/zero/digit count is 0 A/ScalarKeys/far/unreadable options
            A/ScalarKeys/far/doubtful number A/ScalarKeys/unread/unread option
            A/ScalarKeys/unread/wrong metadata A/ScalarKeys/p.same/same as its prefix
            A/ScalarKeys/again/replaced by a later group A/ScalarKeyPrefixes/p./broad prefix
            A/ScalarKeyPrefixes/p.x/prefix never reached A/ScalarKeyPrefixes/com/broad prefix
            A/DistributionKeys/None/wrong kind InternalTesting/ScalarKeys/p.in/same as its prefix
            InternalTesting/ScalarKeyPrefixes/t./broad prefix B/DistributionKeys/e/unread option
            B/DistributionKeyPrefixes//intervals do not rise
            B/DistributionKeyPrefixes//empty prefix""".replace("\n            ", " ").strip()
            .replace(" A/", "\nA/").replace(" B", "\nB").replace(" I", "\nI").splitlines())
        with open("lines", "w", encoding="utf-8") as file:
            file.write("""<ptree version="1.0"><dict><key>G</key><true/><!--
 --><key>G</key><dict><key>About</key><dict><key>expires</key><date>2024-03-05T09:00:00Z</date>
<key>owner</key><true/></dict>
<key>ScalarKeys</key><true/>
<key>ScalarKeys</key><dict><key>a.b</key><true/>
<key
>a.c</key><dict><key>reason</key><string/><key>expires</key><date>2024-03-04T23:59:59Z</date></dict>
<key>a.b</key><dict/></dict></dict></dict></ptree>""")
        place_of = [place(f) for f in json.loads(run(
            "check", "lines", "--json", "--require", "owner,reason,expires", "--today", "2024-03-05")[1])]
        self.assertEqual(place_of, [
            "1/G/None/None/duplicate", "3/G/About/None/wrong metadata",
            "4/G/ScalarKeys/None/duplicate", "5/G/ScalarKeys/a.b/duplicate",
            "6/G/ScalarKeys/a.c/expired", "8/G/ScalarKeys/a.b/missing metadata"])
        self.assertIn("lines:6: group \"G\", ScalarKeys, \"a.c\": expired: ", run("check", "lines")[1])
        self.assertEqual([json.loads(line) for line in run("list", "lines", "--json")[1].splitlines()], [
            {"group": "G", "list": "ScalarKeys", "key": "a.c", "options": {}, "owner": None,
             "reason": "", "expires": {"date": "2024-03-04T23:59:59Z"}, "line": 6},
            {"group": "G", "list": "ScalarKeys", "key": "a.b", "options": {}, "owner": None,
             "reason": None, "expires": {"date": "2024-03-05T09:00:00Z"}, "line": 8}])
        for command in ["check", "list", "diff"]:
            write("array", [])
            status, output, error = vespctl("whitelist", command, "array")
            self.assertEqual((status, output, error.count("\n")), (1, "", 1), error)

    def test_install_and_explain(self):
        vespctl("init", "device")
        self.assertEqual(run("check", "--require", "owner,reason")[0], 0)
        own = "device/Library/Application Support/Tallybook/Whitelist_Stagebox.ptree"
        starter = read(own)
        os.chmod("device", 0o750)
        write("bad", {"G": {"ScalarKeys": {"a": {"sigfig": 1}}}})
        status, output, error = vespctl("whitelist", "install", "bad")
        self.assertEqual((status, output, read(own)), (1, "", starter))
        self.assertRegex(error, r'^vespctl whitelist install: .*bad:\d+: .*unread option')
        with open("rows", "w", encoding="utf-8") as file:
            file.write("scalar\t1\ta\t7\nscalar\tYESTERDAY\tapp.net\t26\nsample\tYESTERDAY\td\t3\t0\n"
                       .replace("YESTERDAY", str(int(time.time()) // 86400 - 1)))
        self.assertEqual(vespctl("counters", "import", "rows")[0], 0)
        self.assertEqual(json.loads(run("install", "bad", "--force", "--json")[1])["scalars"], {
            "added": ["a"], "removed": [], "changed": []})
        self.assertEqual((read(own + ".previous"), read(own)), (starter, read("bad")))
        self.assertEqual(os.stat(own).st_mode & 0o777, 0o640)
        write("array", [])
        self.assertEqual(vespctl("whitelist", "install", "array", "--force")[:2], (1, ""))
        write("good", {"G": {"ScalarKeys": {"a": {"sig_fig": 1}},
                             "ScalarKeyPrefixes": {"app.": {"bucket_interval": 10}},
                             "DistributionKeys": {"d": {"intervals": [5]}}}})
        self.assertEqual(json.loads(vespctl("whitelist", "diff", "good", "--json")[1]), {
            "scalars": {"added": ["app.net"], "removed": [], "changed": [
                {"key": "a", "before": {}, "after": {"sig_fig": 1}, "effect": "coarser"}]},
            "distributions": {"added": ["d"], "removed": [], "changed": []}})
        self.assertIn(f'To go back: vespctl -C "device" whitelist install "{own}.previous"',
                      vespctl("whitelist", "install", "good")[1])
        self.assertEqual((read(own + ".previous"), read(own)), (read("bad"), read("good")))
        told = vespctl("explain", "app.net")[1]
        self.assertIn('As a scalar it leaves, bucket_interval 10: it begins with the prefix "app."', told)
        self.assertIn("carries 30, where 26 was counted", told)
        self.assertIn("As a distribution it stays: nothing", told)
        self.assertIn("1 values from 3.0 to 3.0, their mean 3.0, and how many lie in (-inf, 5]: 1.",
                      vespctl("explain", "d")[1])
        self.assertIn('never counted; the nearest key that was is "app.net"', vespctl("explain", "app.bet")[1])
        both = json.loads(vespctl("explain", "a", "--json")[1])
        self.assertEqual([(e["kind"], e["seen"], e["leaves"], e["values"]) for e in both],
                         [("scalar", True, True, []), ("distribution", False, False, [])])
        self.assertEqual(json.loads(vespctl("explain", "--kind", "scalar", "a", "--json")[1]), both[0])

    def test_example_of_the_documentation(self):
        source = os.path.join(os.path.dirname(__file__), "../..")
        example = os.path.join(source, "examples/whitelist-review")
        path = os.path.dirname(VESPCTL) + os.pathsep + os.environ["PATH"]
        done = subprocess.run(["./review", "whitelist.ptree", "proposed.ptree"], cwd=example,
                              env={**os.environ, "PATH": path}, capture_output=True, check=False)
        self.assertEqual((done.returncode, done.stderr), (3, b""))
        with open(os.path.join(source, "docs/whitelist.md"), encoding="utf-8") as page:
            self.assertIn(done.stdout.decode(), page.read())

    def test_texts_of_documents_are_no_markup(self):
        write("old", {})
        write("new", {"G|": {"ScalarKeys": {"a|b`<b>\n| x | [l](u) *e*": {}}}})
        self.assertEqual(run("diff", "--markdown", "old", "new")[1].splitlines()[4:], [
            "| added | scalar key | <code>a&#124;b&#96;&#60;b&#62;&#92;x0a&#124; x &#124; &#91;l&#93;"
            "(u) &#42;e&#42;</code> | no entry | exactly as counted |", "",
            '- A new group, which can be switched off by its name: "G&#124;".'])

    def test_random_changes(self):
        for seed in range(150):
            chance = random.Random(seed)
            old = random_whitelist(chance)
            new = random_whitelist(chance) if seed % 5 == 0 else changed_whitelist(chance, old)
            write("old", old)
            write("new", new)
            expected = set()
            for kind, where, of in zip(["scalars"] * 2 + ["distributions"] * 2,
                                       ["keys", "prefixes"] * 2, LISTS):
                before, after = entries(old, of), entries(new, of)
                for key in before.keys() | after.keys():
                    told = effect(before.get(key), after.get(key))
                    if told:
                        expected.add(f"{kind} {where} {key} {told}")
            status, answer = diff()
            self.assertEqual(changes(answer), expected, seed)
            more = any(not told.endswith(("coarser", "removed")) for told in expected)
            self.assertEqual(status, 3 if more else 0, seed)


def number(value):
    return isinstance(value, (int, float)) and not isinstance(value, bool)


def entries(groups, of):
    """What counts in the lists of that name: the amounts that its options tell, None for unread."""
    counted = {}
    for name, lists in groups.items():
        if name != "InternalTesting" and isinstance(lists, dict):
            if isinstance(lists.get(of), dict):
                counted.update(lists[of])
    return {key: told for key, options in counted.items() if (told := amounts(options, of))}


def amounts(options, of):
    """For each option a number or set: the greater, the more it tells; and the options as read."""
    if not isinstance(options, dict):
        return None
    if of.startswith("Scalar"):
        interval, digits = options.get("bucket_interval"), options.get("sig_fig")
        if not all(value is None or number(value) for value in (interval, digits)):
            return None
        finest = 0 if interval is None else -math.inf if interval == 0 else -interval
        return (interval, digits), [finest, math.inf if digits is None else digits]
    bounds = options.get("intervals")
    if bounds is None:
        return "none", [frozenset()]
    if not isinstance(bounds, list) or not all(map(number, bounds)):
        return None
    return bounds, [frozenset(bounds)]


def effect(before, after):
    if not before or not after:
        return "added" if after else "removed" if before else None
    if before[0] == after[0]:
        return None
    pairs = list(zip(before[1], after[1]))
    more = any(not b >= a for b, a in pairs)
    less = any(not a >= b for b, a in pairs)
    return "different" if more == less else "finer" if more else "coarser"


def random_options(chance, of):
    if chance.random() < 0.1:
        return chance.choice([True, "x", [], {"sig_fig": True}, {"intervals": ["1"]}, {"intervals": 2}])
    if of.startswith("Distribution"):
        bounds = chance.choices([1, 2.0, 2, 3.5, 2**63, 1e300, -4], k=chance.randrange(5))
        return chance.choice([{}, {"intervals": bounds}, {"intervals": sorted(set(bounds))}])
    options = {}
    for name in ["sig_fig", "bucket_interval", "sigfig", "owner"]:
        if chance.random() < 0.5:
            options[name] = chance.choice([0, 1, 2, 3, 2.0, 10, 100])
    return options


def random_whitelist(chance):
    return {group: {of: {key: random_options(chance, of) for key in ["a", "a.b", "ä", "A", ""]
                         if chance.random() < 0.6}
                    for of in LISTS if chance.random() < 0.8}
            for group in chance.sample(["G", "InternalTesting", "H"], k=chance.randrange(4))}


def changed_whitelist(chance, old):
    new = copy.deepcopy(old)
    for lists in new.values():
        for of, entries_of in lists.items():
            for key in entries_of:
                if chance.random() < 0.3:
                    entries_of[key] = random_options(chance, of)
    return new


__file__ = os.path.abspath(__file__)

if __name__ == "__main__":
    with tempfile.TemporaryDirectory() as folder:
        os.chdir(folder)
        unittest.main()
