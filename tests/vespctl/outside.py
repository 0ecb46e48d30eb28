#!/usr/bin/env python3
"""What leaves a device for other programs (arguments 1 and 2: vespctl and vespfleet): formats and
upload, with real servers and readers where they are installed.
"""
import base64
import csv
import gzip
import http.server
import io
import json
import os
import pathlib
import shutil
import socket
import ssl
import subprocess
import sys
import tempfile
import threading
import time
import urllib.request

VESPCTL, VESPFLEET = sys.argv[1:3]
failures = []


def check(what, found, expected):
    if found != expected:
        failures.append(f"{what}: {found!r} instead of {expected!r}")


def run(program, *arguments, status=0):
    done = subprocess.run([program, *map(str, arguments)], capture_output=True, text=True, check=False)
    if done.returncode != status:
        failures.append(f"{arguments}: {done.returncode}, {done.stderr}")
    return done.stdout


def make_device(folder, name, value):
    """A device with three daily logs."""
    device = pathlib.Path(folder, name)
    run(VESPCTL, "init", device, "--sample")
    for day in ("-f", "-t", "-f"):
        run(VESPCTL, "-C", device, "counters", "set", "apps.launches", value)
        run(VESPCTL, "-C", device, "run", "--", day)
    return device


def formats(folder):
    """All formats say the same."""
    device = make_device(folder, "device", 5)
    lines = [json.loads(line) for line in run(VESPCTL, "-C", device, "export").splitlines()]
    expected = set()
    for line in lines:
        about = (line["device"], str(line["day"]), str(line["revision"]), line["build"] or "", line["model"] or "")
        expected |= {(*about, "scalar", key, "value", str(value)) for key, value in line["scalars"].items()}
        expected |= {(*about, "distribution", key, field, float(value))
                     for key, values in line["distributions"].items()
                     for field, value in zip(("minimum", "maximum", "mean", "deviations", "count"), values)}
        expected |= {(*about, "histogram", key, label, float(count))
                     for key, buckets in line["histograms"].items() for label, count in buckets.items()}
    text = run(VESPCTL, "-C", device, "export", "--format", "csv")
    rows = {(r["device"], r["day"], r["revision"], r["build"], r["model"], r["kind"], r["key"], r["field"],
             r["value"] if r["kind"] == "scalar" else float(r["value"]))
            for r in csv.DictReader(io.StringIO(text))}
    check("logs", len(lines), 3)
    check("rows of csv", rows ^ expected, set())
    metrics = run(VESPCTL, "-C", device, "export", "--format", "openmetrics")
    for key, value in lines[-1]["scalars"].items():
        check("a scalar's sample", f'vesprun_scalar{{key="{key}"}} {value}\n' in metrics, True)
    for key, (_, _, mean, _, count) in lines[-1]["distributions"].items():
        family = "vesprun_distribution" if key in lines[-1]["histograms"] else "vesprun_distribution_plain"
        check("a count", f'{family}_count{{key="{key}"}} {count}\n' in metrics, count != 0)
        total = [line for line in metrics.splitlines() if line.startswith(f'{family}_sum{{key="{key}"}}')]
        buckets = lines[-1]["histograms"].get(key)
        whole = f'vesprun_distribution_bucket{{key="{key}",le="+Inf"}} {sum(buckets.values()) if buckets else 0}\n'
        check("all buckets", whole in metrics, buckets is not None)
        check("a sum", [float(line.split()[-1]) for line in total], [mean * count] if count else [])
    if shutil.which("promtool"):
        lint = subprocess.run(["promtool", "check", "metrics"], input=metrics, capture_output=True, text=True, check=False)
        check("promtool", (lint.returncode, lint.stderr), (0, ""))
    if shutil.which("prometheus-node-exporter"):
        node_exporter(folder, metrics)
    run(VESPCTL, "-C", device, "export", "--format", "xml", status=2)
    nothing = run(VESPCTL, "-C", device, "export", "--format", "csv", "--to", "5")
    check("no day", nothing, "device,day,date,revision,build,model,kind,key,field,value\n")


def free_port():
    with socket.socket() as probe:
        probe.bind(("127.0.0.1", 0))
        return probe.getsockname()[1]


def answer(url, process):
    for _ in range(500):
        try:
            with urllib.request.urlopen(url, timeout=10) as reply:
                return reply.read().decode()
        except OSError:
            if process.poll() is not None:
                raise
            time.sleep(0.02)
    return ""


def node_exporter(folder, metrics):
    """What the node exporter serves is what the log has."""
    pathlib.Path(folder, "vesprun.prom").write_text(metrics)
    address = f"127.0.0.1:{free_port()}"
    with subprocess.Popen(
            ["prometheus-node-exporter", "--collector.disable-defaults", "--collector.textfile",
             f"--collector.textfile.directory={folder}", f"--web.listen-address={address}"],
            stderr=subprocess.DEVNULL) as exporter:
        served = answer(f"http://{address}/metrics", exporter)
        exporter.kill()

    def samples(text):
        found = {}
        for line in text.splitlines():
            if line.startswith("vesprun_"):
                name, value = line.rsplit(" ", 1)
                found[name.replace('+Inf', 'Inf')] = float(value)
        return found

    ours = samples(metrics)
    check("served", {k: v for k, v in samples(served).items() if k in ours}, ours)
    check("served without error", "node_textfile_scrape_error 0" in served, True)


class Server(http.server.BaseHTTPRequestHandler):
    """Keeps what it gets, after what `script` has for the requests to come."""

    script = []
    kept = {}
    headers_seen = []

    def do_PUT(self):
        body = self.rfile.read(int(self.headers["Content-Length"]))
        how = self.script.pop(0) if self.script else 201
        self.headers_seen.append(self.headers["Authorization"])
        if how == "cut":
            self.connection.shutdown(socket.SHUT_RDWR)
            return
        if how == "slow":
            time.sleep(3)
            how = 204
        if how in ("cut headers", "cut body"):
            if how == "cut body":
                self.kept[self.path] = body
            self.wfile.write(b"HTTP/1.1 200 OK\r\nContent-Length: 100\r\n" + b"\r\nshort" * (how == "cut body"))
            self.connection.shutdown(socket.SHUT_RDWR)
            return
        if 200 <= how < 300:
            self.kept[self.path] = body
        self.send_response(how)
        if 300 <= how < 400:
            self.send_header("Location", "/elsewhere")
        self.send_header("Content-Length", "0")
        self.end_headers()

    def log_message(self, *_):
        pass


def lying_server(folder):
    """Wrong codes, redirects, cuts and slow answers: each log is acknowledged once."""
    device = make_device(folder, "device", 6)
    exported = run(VESPCTL, "-C", device, "export").splitlines(keepends=True)
    headers = pathlib.Path(folder, "headers")
    headers.write_text("Authorization: Basic abc\n")
    headers.chmod(0o640)
    with http.server.ThreadingHTTPServer(("127.0.0.1", 0), Server) as server:
        threading.Thread(target=server.serve_forever, daemon=True).start()
        url = f"http://127.0.0.1:{server.server_port}/in/"

        def upload(*script, status, sent, waiting, more=()):
            Server.script[:] = script
            told = run(VESPCTL, "-C", device, "upload", url, "--json", *more, status=status)
            check(f"upload after {script}", json.loads(told), {"sent": sent, "waiting": waiting})

        run(VESPCTL, "-C", device, "upload", url, "--headers", headers, status=1)
        headers.chmod(0o600)
        headers.write_text("no header\n")
        run(VESPCTL, "-C", device, "upload", url, "--headers", headers, status=1)
        check("sent with a bad file of headers", Server.headers_seen, [])
        headers.write_text("Authorization: Basic abc\n")
        for wrong in ("ftp://h/", "http://user@h/", "http://user:p@h/", "nothing"):
            run(VESPCTL, "-C", device, "upload", wrong, status=2)
        upload(500, status=1, sent=0, waiting=3)
        upload(302, status=1, sent=0, waiting=3, more=("--headers", headers))
        upload(404, status=1, sent=0, waiting=3)
        upload("cut", "cut", status=1, sent=0, waiting=3)
        upload("cut headers", status=1, sent=0, waiting=3)
        upload("cut body", 403, status=1, sent=1, waiting=2)
        upload("slow", 201, status=0, sent=2, waiting=0)
        upload(status=0, sent=0, waiting=0)
        check("headers", set(Server.headers_seen), {None, "Basic abc"})
        kept = Server.kept
        names = [f"/in/{line['device']}/{line['day']}-{line['revision']}.jsonl.gz" for line in map(json.loads, exported)]
        check("names", sorted(kept), sorted(names))
        check("content", [gzip.decompress(kept[name]).decode() for name in names], exported)
        server.shutdown()
    notes = pathlib.Path(device, "outbox", "uploaded.jsonl").read_text().splitlines()
    check("notes", [json.loads(note)["revision"] for note in notes], [json.loads(line)["revision"] for line in exported])


def journal(folder):
    """Lines for the journal carry their level, and others do not."""
    with open(pathlib.Path(folder, "lines"), "w+", encoding="utf-8") as lines:
        status = os.fstat(lines.fileno())
        for stream in (f"{status.st_dev}:{status.st_ino}", f"{status.st_dev}:{status.st_ino + 1}", "", "x:y"):
            subprocess.run([VESPCTL, "-C", folder, "days"], stderr=lines, check=False,
                           env={**os.environ, "JOURNAL_STREAM": stream})
        lines.seek(0)
        check("levels", [line.split(":")[0] for line in lines], ["<3>vespctl days"] + 3 * ["vespctl days"])


NGINX = """
daemon off; master_process off; error_log {folder}/error.log; pid {folder}/pid;
events {{}}
http {{
  access_log off; client_body_temp_path {folder}/body; client_max_body_size 32m;
  server {{
    listen 127.0.0.1:{port} ssl;
    ssl_certificate {folder}/certificate.pem; ssl_certificate_key {folder}/key.pem;
    auth_basic vesprun; auth_basic_user_file {folder}/users;
    location ~ ^/in/(?<device>[^/]+)/ {{
      if ($remote_user != $device) {{ return 403; }}
      root {folder}; dav_methods PUT; create_full_put_path on;
    }}
  }}
}}
"""


def nginx(folder):
    """From two devices through a real server with failures in between to an answer of the fleet."""
    run("openssl", "req", "-x509", "-newkey", "rsa:2048", "-nodes", "-days", "1", "-subj", "/CN=localhost", "-addext",
        "subjectAltName=IP:127.0.0.1", "-keyout", f"{folder}/key.pem", "-out", f"{folder}/certificate.pem")
    port = free_port()
    pathlib.Path(folder, "nginx.conf").write_text(NGINX.format(folder=folder, port=port))
    pathlib.Path(folder, "users").write_text("one:{PLAIN}first\ntwo:{PLAIN}second\n")
    url = f"https://127.0.0.1:{port}/in"
    devices = {name: make_device(folder, name, value) for name, value in (("one", 10), ("two", 30))}
    for name, password in (("one", "first"), ("two", "second")):
        headers = pathlib.Path(folder, name + ".headers")
        headers.touch(mode=0o600)
        headers.write_text("Authorization: Basic " + base64.b64encode(f"{name}:{password}".encode()).decode() + "\n")

    def upload(name, status, device=None, authorities=True):
        trust = ["--ca", f"{folder}/certificate.pem"] if authorities else []
        told = run(VESPCTL, "-C", devices[name], "upload", url, "--device", device or name, "--json", "--headers",
                   f"{folder}/{name}.headers", *trust, status=status)
        return json.loads(told)

    check("no server", upload("one", 1), {"sent": 0, "waiting": 3})
    with subprocess.Popen(["nginx", "-p", folder, "-c", f"{folder}/nginx.conf"], stderr=subprocess.DEVNULL) as server:
        while server.poll() is None and socket.socket().connect_ex(("127.0.0.1", port)):
            time.sleep(0.02)
        check("unknown authority", upload("one", 1, authorities=False), {"sent": 0, "waiting": 3})
        wrong = subprocess.run(
            [VESPCTL, "-C", devices["one"], "upload", url.replace("127.0.0.1", "localhost"), "--ca", f"{folder}/certificate.pem"],
            capture_output=True, text=True, check=False)
        check("wrong name", (wrong.returncode, "host name 'localhost'" in wrong.stderr), (1, True))
        check("as another device", upload("one", 1, device="two"), {"sent": 0, "waiting": 3})
        for name in devices:
            check("sent to nginx", upload(name, 0), {"sent": 3, "waiting": 0})
        server.terminate()
    store = pathlib.Path(folder, "fleet.db")
    run(VESPFLEET, "load", "--least", "3", "--spool", store, f"{folder}/in")
    check("spool", list(pathlib.Path(folder, "in").rglob("*.gz")), [])
    days = [json.loads(line) for line in run(VESPFLEET, "devices", store, "--json").splitlines()]
    check("devices of the fleet", sum(day["devices"] for day in days), 2)


for case in (formats, lying_server, journal, nginx):
    if case is nginx and not shutil.which("nginx"):
        continue
    with tempfile.TemporaryDirectory() as place:
        os.chmod(place, 0o755)
        try:
            case(place)
        except (OSError, KeyError, ValueError, subprocess.SubprocessError, ssl.SSLError) as error:
            failures.append(f"{case.__name__}: {error!r}")
print("\n".join(failures), file=sys.stderr)
sys.exit(1 if failures else 0)
