#!/usr/bin/python3
"""Metrics, alert rules and dashboard in the real node_exporter, Prometheus and promtool, each on a port of the loopback.
Grafana is not asked: of the dashboard, its form and its queries are checked.
usage: monitoring_test.py MORVANE-VIEW PROGRAMS, a folder that Debian's packages of the programs were unpacked into
"""

import http.server
import json
import re
import socket
import subprocess
import sys
import tempfile
import threading
import time
import unittest
import urllib.error
import urllib.parse
import urllib.request
from pathlib import Path

HERE = Path(__file__).resolve().parent
ROOT = HERE.parents[1]
sys.path.insert(0, str(HERE.parent / "view"))

import make_log
from support import host_log, hosts, lab_log, lab_stages, run

PROGRAMS = Path(sys.argv[2]).resolve() / "usr" / "bin"
RULES = ROOT / "monitoring" / "morvane.rules.yml"
DASHBOARD = json.loads((ROOT / "monitoring" / "morvane-dashboard.json").read_text())
PAGE = (ROOT / "docs" / "monitoring.md").read_text()
LIMIT = 60  # seconds that anything may take
# The parts of a file that are a sample of Morvane's.
SAMPLES = re.compile(r"^morvane_\S+?(?:\{.*\})? \d\S*$", re.M)

# A host of which node_exporter tells what the metrics are joined with: the disks and maps of the laboratory's run, and
# its FC ports.
LOG = lab_log("link-down")
MAP = "mpath-36001405abfc200000000000000000000"
PORTS = {"host3": "2000525400fa0a01", "host4": "2000525400fa0b01"}


def free_port():
    with socket.socket() as place:
        place.bind(("127.0.0.1", 0))
        return place.getsockname()[1]


def get(url):
    with urllib.request.urlopen(url, timeout=LIMIT) as answer:
        return answer.read().decode()


def eventually(ask):
    """What `ask` gives once it is something, and nothing failed on the way."""
    end = time.monotonic() + LIMIT
    while True:
        try:
            answer = ask()
        except (urllib.error.URLError, ConnectionError):
            answer = None
        if answer or time.monotonic() > end:
            return answer
        time.sleep(0.1)


def write_metrics(path, log):
    done = run("--prometheus", path, "-", log=log)
    assert done.returncode == 0, done.stderr


def promtool(*arguments, text=""):
    return subprocess.run([PROGRAMS / "promtool", *map(str, arguments)], input=text, text=True, capture_output=True, check=False,
                          timeout=LIMIT)


def logs():
    """Logs of many kinds, by a name."""
    odd = make_log.troubled('h"\\o').bytes().replace(b"ARRAY 9", b'A"\\ \xc3\xa4\xe9|{}')
    return ({host: host_log(host) for host in hosts()} | {stage: lab_log(stage) for stage in lab_stages()} |
            {"troubled": odd, "cut": odd[:9000], "big": make_log.big(2000).bytes()})


class Program:
    """A program that runs until close(), what it says in a file."""

    def __init__(self, folder, name, *arguments):
        with open(folder / f"{name}.said", "wb") as said:
            self.process = subprocess.Popen([PROGRAMS / name, *arguments], cwd=folder, stdin=subprocess.DEVNULL,
                                            stdout=said, stderr=said)

    def close(self):
        self.process.terminate()
        try:
            self.process.wait(10)
        except subprocess.TimeoutExpired:
            self.process.kill()
            self.process.wait()


class NodeExporter(Program):
    """The real one on a host of files: an FC adapter's ports, a disk for each of the log's, a multipath map."""

    def __init__(self, folder):
        self.textfiles = folder / "textfiles"
        self.textfiles.mkdir()
        for host, port in PORTS.items():
            place = folder / "sys" / "class" / "fc_host" / host
            (place / "statistics").mkdir(parents=True)
            for name, text in (("port_name", "0x" + port), ("port_state", "Online"), ("speed", "16 Gbit")):
                (place / name).write_text(text + "\n")
            for name in ("port_type", "port_id", "fabric_name", "node_name", "symbolic_name", "supported_classes",
                         "supported_speeds", "dev_loss_tmo"):
                (place / name).write_text("0x0\n")
        (folder / "proc").mkdir()
        (folder / "udev").mkdir()
        disks = sorted(set(re.findall(r"/dev/(sd[a-z]+)\b", LOG.decode("utf-8", "replace"))))
        lines = [f"   8 {16 * number} {disk} 1 2 3 4 5 6 7 8 9 10 11" for number, disk in enumerate(disks)]
        (folder / "proc" / "diskstats").write_text("\n".join(lines + [" 254 0 dm-0 1 2 3 4 5 6 7 8 9 10 11", ""]))
        (folder / "udev" / "b254:0").write_text(f"E:DM_NAME=mpatha\nE:DM_UUID={MAP}\n")
        self.address = f"127.0.0.1:{free_port()}"
        super().__init__(folder, "prometheus-node-exporter", "--collector.disable-defaults", "--collector.textfile",
                         "--collector.fibrechannel", "--collector.diskstats",
                         f"--collector.textfile.directory={self.textfiles}", f"--path.sysfs={folder / 'sys'}",
                         f"--path.procfs={folder / 'proc'}", f"--path.udev.data={folder / 'udev'}",
                         f"--web.listen-address={self.address}")
        assert eventually(self.metrics), "node_exporter says: " + (folder / "prometheus-node-exporter.said").read_text()

    def metrics(self):
        return get(f"http://{self.address}/metrics")


class OpenMetrics(http.server.BaseHTTPRequestHandler):
    """Gives the metrics as what OpenMetrics calls them, so that Prometheus parses them so."""

    def do_GET(self):
        self.send_response(200)
        self.send_header("Content-Type", "application/openmetrics-text; version=1.0.0; charset=utf-8")
        self.end_headers()
        self.wfile.write(self.server.metrics)

    def log_message(self, *_):
        pass


class Tools(unittest.TestCase):
    def test_promtool_finds_no_fault_in_the_metrics_of_any_log(self):
        with tempfile.TemporaryDirectory() as folder:
            for name, log in logs().items():
                with self.subTest(name):
                    write_metrics(Path(folder, "x.prom"), log)
                    done = promtool("check", "metrics", text=Path(folder, "x.prom").read_text(encoding="utf-8"))
                    self.assertEqual((done.returncode, done.stdout, done.stderr), (0, "", ""))

    def test_promtool_takes_the_rules_and_each_alert_is_as_expected(self):
        done = promtool("check", "rules", RULES)
        self.assertEqual((done.returncode, done.stderr), (0, ""), done.stdout)
        with tempfile.TemporaryDirectory() as folder:
            test = Path(folder, "test.yml")
            test.write_text((HERE / "rules_test.yml").read_text().replace("[RULES]", json.dumps([str(RULES)])))
            done = promtool("test", "rules", test)
        self.assertEqual(done.returncode, 0, done.stdout + done.stderr)

    def test_every_alert_is_tried(self):
        alerts = re.findall(r"- alert: (\w+)", RULES.read_text())
        tried = re.findall(r"alertname: (\w+)\n +exp_alerts:", (HERE / "rules_test.yml").read_text())
        self.assertEqual(sorted(set(tried)), sorted(alerts))


class TextfileCollector(unittest.TestCase):
    def test_takes_the_metrics_of_every_log_as_they_are(self):
        with tempfile.TemporaryDirectory() as name:
            exporter = NodeExporter(Path(name))
            self.addCleanup(exporter.close)
            for host, log in logs().items():
                with self.subTest(host):
                    file = exporter.textfiles / "morvane.prom"
                    write_metrics(file, log)
                    told = exporter.metrics()
                    self.assertIn("\nnode_textfile_scrape_error 0\n", told)
                    self.assertEqual(series(told), series(file.read_text(encoding="utf-8")))
                    helps = [line for line in told.splitlines() if line.startswith("# HELP morvane_")]
                    self.assertTrue(set(helps) <= set(file.read_text(encoding="utf-8").splitlines()))


def series(text):
    """Morvane's samples: the parts of the labels by name, and the value as a number."""
    found = {}
    for sample in SAMPLES.findall(text):
        name, value = sample.rsplit(" ", 1)
        labels = frozenset(re.findall(r'(\w+="(?:[^"\\]|\\.)*")', name))
        found[name.split("{", 1)[0], labels] = float(value)
    return found


class Server(unittest.TestCase):
    """Prometheus, with the rules, scraping node_exporter every second."""

    @classmethod
    def setUpClass(cls):
        scratch = tempfile.TemporaryDirectory()
        cls.addClassCleanup(scratch.cleanup)
        folder = Path(scratch.name)
        exporter = NodeExporter(folder)
        cls.addClassCleanup(exporter.close)
        write_metrics(exporter.textfiles / "morvane.prom", LOG)
        # A time of the run comes from the log's file, which a pipe has not.
        (folder / "Morvane.log").write_bytes(LOG)
        assert run("--prometheus", exporter.textfiles / "morvane.prom", folder / "Morvane.log").returncode == 0
        openmetrics = http.server.ThreadingHTTPServer(("127.0.0.1", 0), OpenMetrics)
        openmetrics.metrics = (exporter.textfiles / "morvane.prom").read_bytes()
        cls.addClassCleanup(openmetrics.server_close)
        threading.Thread(target=openmetrics.serve_forever, daemon=True).start()
        cls.addClassCleanup(openmetrics.shutdown)
        cls.address = f"127.0.0.1:{free_port()}"
        config = {"global": {"scrape_interval": "1s", "evaluation_interval": "1s"}, "rule_files": [str(RULES)],
                  "scrape_configs": [
                      {"job_name": "node", "static_configs": [{"targets": [exporter.address]}]},
                      {"job_name": "openmetrics", "static_configs": [
                          {"targets": [f"127.0.0.1:{openmetrics.server_address[1]}"]}]}]}
        (folder / "prometheus.yml").write_text(json.dumps(config))  # JSON is YAML, too
        server = Program(folder, "prometheus", "--config.file=prometheus.yml", f"--storage.tsdb.path={folder / 'data'}",
                         f"--web.listen-address={cls.address}")
        cls.addClassCleanup(server.close)
        # Two scrapes, so that there are rates.
        assert eventually(lambda: cls.answer("count_over_time(node_disk_read_bytes_total[1m]) > 2") and
                          cls.answer('morvane_luns{job="openmetrics"}')), (folder / "prometheus.said").read_text()

    @classmethod
    def ask(cls, path, **parameters):
        query = urllib.parse.urlencode(parameters)
        return json.loads(get(f"http://{cls.address}/api/v1/{path}?{query}"))["data"]

    @classmethod
    def answer(cls, expression):
        """The series that an expression gives now."""
        return cls.ask("query", query=expression)["result"]

    def series_of(self, expression):
        try:
            return self.answer(expression)
        except urllib.error.HTTPError as error:
            self.fail(f"{expression}: {error.read().decode()}")

    def test_parses_the_metrics_as_openmetrics_to_the_same(self):
        def values(job):
            return {json.dumps({label: value for label, value in sample["metric"].items()
                                if label not in ("job", "instance")}, sort_keys=True): sample["value"][1]
                    for sample in self.answer(f'{{__name__=~"morvane_.*",job="{job}"}}')}

        self.assertGreater(len(values("node")), 80)
        self.assertEqual(values("openmetrics"), values("node"))

    def test_answers_every_query_of_the_dashboard_with_series(self):
        for panel in DASHBOARD["panels"]:
            for target in panel["targets"]:
                expression = target["expr"].replace("$instance", ".*").replace("$__rate_interval", "30s")
                with self.subTest(panel["title"]):
                    self.assertNotIn("$", expression)
                    found = self.series_of(expression)
                    self.assertTrue(found, expression)
                    for label in re.findall(r"{{(\w+)}}", target.get("legendFormat", "")):
                        self.assertIn(label, found[0]["metric"])
        self.assertTrue(self.ask("label/instance/values", **{"match[]": "morvane_luns"}))

    def test_answers_every_query_of_the_documentation_with_series(self):
        queries = re.findall(r"^```promql\n(.*?)^```$", PAGE, re.M | re.S)
        self.assertGreaterEqual(len(queries), 4)
        for query in queries:
            with self.subTest(query):
                self.assertTrue(self.series_of(query), query)

    def test_joins_lead_to_what_node_exporter_calls_by_the_same_name(self):
        queries = re.findall(r"^```promql\n(.*?)^```$", PAGE, re.M | re.S)

        def found(word, *labels):
            query = next(query for query in queries if word in query)
            return {tuple(sample["metric"].get(label) for label in labels) for sample in self.series_of(query)
                    if sample["metric"].get("job") != "openmetrics"}

        self.assertEqual(found("node_disk_device_mapper_info", "name", "identifier"),
                         {("mpatha", "6001405ABFC200000000000000000000")})
        self.assertEqual(found("node_fibrechannel_info", "fc_host", "port_name"), set(PORTS.items()))
        self.assertIn(("6001405ABFC200000000000000000000",), found("node_disk_io_time_seconds_total", "identifier"))

    def test_loads_the_rules_and_evaluates_each(self):
        def evaluated():
            rules = self.ask("rules")["groups"][0]["rules"]
            return rules if all(rule["health"] != "unknown" for rule in rules) else None

        rules = eventually(evaluated)
        self.assertEqual({rule["name"]: (rule["health"], rule.get("lastError")) for rule in rules},
                         {name: ("ok", None) for name in re.findall(r"- alert: (\w+)", RULES.read_text())})


class Dashboard(unittest.TestCase):
    def test_has_the_form_that_grafana_documents(self):
        self.assertEqual(set(DASHBOARD) - {"annotations", "editable", "refresh", "tags", "timezone"},
                         {"title", "uid", "schemaVersion", "version", "time", "templating", "panels"})
        self.assertNotIn("id", DASHBOARD)  # the number that a Grafana gives it
        self.assertLessEqual(len(DASHBOARD["uid"]), 40)
        panels = DASHBOARD["panels"]
        self.assertEqual([panel["id"] for panel in panels], list(range(1, len(panels) + 1)))
        taken = set()
        for panel in panels:
            self.assertIn(panel["type"], ("stat", "table", "timeseries"))
            place = panel["gridPos"]
            self.assertLessEqual(place["x"] + place["w"], 24)
            cells = {(x, y) for x in range(place["x"], place["x"] + place["w"]) for y in range(place["y"], place["y"] + place["h"])}
            self.assertEqual(taken & cells, set(), panel["title"])
            taken |= cells
            self.assertEqual([target["refId"] for target in panel["targets"]],
                             [chr(ord("A") + number) for number in range(len(panel["targets"]))])

    def test_asks_the_source_and_the_hosts_that_its_variables_name(self):
        variables = {variable["name"]: variable["type"] for variable in DASHBOARD["templating"]["list"]}
        self.assertEqual(variables, {"datasource": "datasource", "instance": "query"})
        for panel in DASHBOARD["panels"]:
            for part in (panel, *panel["targets"]):
                self.assertEqual(part["datasource"], {"type": "prometheus", "uid": "${datasource}"})
            for target in panel["targets"]:
                self.assertIn('instance=~"$instance"', target["expr"])


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[3:]])
