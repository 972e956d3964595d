"""The metrics of a run in node_exporter and Prometheus: scraped, queried, alerted on, drawn."""

import json
import re
import subprocess
import urllib.parse
import urllib.request

import pytest

from clmodel import ClGpu
from engines import INTEGRATIONS, Server, needed, outcome_of
from harness import BUILD, TREE, until
from hosting import run_assay
from model import Gpu

RULES = INTEGRATIONS / "prometheus" / "assay-rules.yml"
DASHBOARD = INTEGRATIONS / "prometheus" / "assay-dashboard.json"
DOCS = TREE / "docs" / "fleet.md"
LISTENING = r'msg="Listening on" address=(127\.0\.0\.1:\d+)'

CONFIGURATION = """\
global: {{scrape_interval: 100ms, scrape_timeout: 100ms, evaluation_interval: 100ms}}
rule_files: [rules.yml]
scrape_configs:
  - job_name: node
    static_configs: [{{targets: ["{exporter}"], labels: {{instance: machine}}}}]
"""


def run_of_one_card(host, rules="", output=None):
    """A run on a machine with a card that has both interfaces."""
    (host.folder / "opencl.script").write_text(ClGpu().script(), encoding="ascii")
    machine = {"script": Gpu().script() + rules, "opencl": "empty"}
    options = ["--format", "prometheus", *(["--output", str(output)] if output else [])]
    host.variables = {"OCL_ICD_VENDORS": str(BUILD / "drivers" / "opencl"),
                      "ASSAY_SCRIPTED_OPENCL": str(host.folder / "opencl.script")}
    return run_assay(host, *options, machine=machine)


@pytest.mark.parametrize("rules, status", [("", 0), ("at glCompileShader crash\n", 3),
                                           ("string GL_VENDOR \"\\x00\\xFF\\\"\\n\\\\\"\n", 0)])
def test_metrics_are_accepted(host, rules, status):
    hosted = run_of_one_card(host, rules=rules)
    assert hosted.status == status
    check = subprocess.run([needed("promtool"), "check", "metrics"], input=hosted.out,
                           stdout=subprocess.PIPE, stderr=subprocess.STDOUT, check=False)
    assert (check.returncode, check.stdout.decode()) == (0, "")


def test_series_of_a_machine_with_one_card(host):
    text = run_of_one_card(host).text
    series = [line for line in text.splitlines() if not line.startswith("#")]
    # Without an adapter nothing is known of the memory of the OpenGL device, and whether it is
    # integrated.
    assert len(series) == 35
    assert 'assay_memory_bytes{api="opencl",device="clgpu[0]"} 3221225472' in series
    assert 'assay_copy_bytes_per_second{api="opencl",device="clgpu[0]"} 1677720000' in series


def test_rules_are_valid():
    status, text = outcome_of(needed("promtool"), "check", "rules", RULES)
    assert (status, "7 rules found" in text) == (0, True), text


def test_alerts_fire_after_their_time():
    status, text = outcome_of(needed("promtool"), "test", "rules",
                              TREE / "tests" / "engines" / "assay-rules-test.yml")
    assert status == 0, text


class Prometheus:
    """Prometheus with a node_exporter that reads the files of a folder."""

    def __init__(self, folder):
        self.textfiles = folder / "textfiles"
        self.textfiles.mkdir()
        self.folder = folder
        self.exporter = Server(
            folder / "exporter.log", needed("prometheus-node-exporter"),
            "--web.listen-address=127.0.0.1:0", "--collector.disable-defaults",
            "--collector.textfile", f"--collector.textfile.directory={self.textfiles}")
        self.server = Server(
            folder / "prometheus.log", needed("prometheus"), "--web.listen-address=127.0.0.1:0",
            f"--config.file={folder / 'prometheus.yml'}", f"--storage.tsdb.path={folder / 'data'}")

    def __enter__(self):
        self.exporter.__enter__()
        exporter = self.exporter.wait_for(LISTENING).group(1)
        rules = re.sub(r"for: \d+m", "for: 0s", RULES.read_text(encoding="utf-8"))
        (self.folder / "rules.yml").write_text(rules, encoding="utf-8")
        (self.folder / "prometheus.yml").write_text(CONFIGURATION.format(exporter=exporter),
                                                    encoding="utf-8")
        self.server.__enter__()
        self.address = self.server.wait_for(LISTENING).group(1)
        self.server.wait_for("Server is ready to receive web requests")
        return self

    def __exit__(self, *_):
        self.server.__exit__()
        self.exporter.__exit__()

    def get(self, path, **parameters):
        url = f"http://{self.address}/api/v1/{path}?{urllib.parse.urlencode(parameters)}"
        with urllib.request.urlopen(url) as answer:
            result = json.load(answer)
        assert result["status"] == "success"
        return result["data"]

    def query(self, expression):
        """The result of a query as pairs of labels and value."""
        data = self.get("query", query=expression)["result"]
        return [(each["metric"], float(each["value"][1])) for each in data]

    def alerts(self):
        return {alert["labels"]["alertname"] for alert in self.get("alerts")["alerts"]
                if alert["state"] == "firing"}


@pytest.fixture(name="prometheus")
def fixture_prometheus(tmp_path):
    with Prometheus(tmp_path) as prometheus:
        yield prometheus


def test_run_is_scraped_and_an_alert_fires_when_the_driver_crashes(host, prometheus):
    file = prometheus.textfiles / "assay.prom"
    hosted = run_of_one_card(host, rules="at glCompileShader crash\n", output=file)
    assert hosted.status == 3
    until(lambda: "AssayDriverCrashed" in prometheus.alerts(), "no alert fires")
    assert prometheus.query('assay_run_verdict == 1')[0][0]["verdict"] == "crashed"

    assert run_of_one_card(host, output=file).status == 0
    until(lambda: prometheus.query('assay_run_verdict{verdict="complete"} == 1'), "no new run")
    until(lambda: "AssayDriverCrashed" not in prometheus.alerts(), "the alert doesn't end")
    devices = prometheus.query("assay_device_info")
    assert [value for _, value in devices] == [1, 1]
    assert {(labels["instance"], labels["device"]) for labels, _ in devices} == {
        ("machine", "glgpu[0]"), ("machine", "clgpu[0]")}
    assert prometheus.query("node_textfile_scrape_error")[0][1] == 0
    # One series for each that the file has.
    written = [line for line in file.read_text().splitlines() if not line.startswith("#")]
    assert prometheus.query('count({__name__=~"assay_.*"})')[0][1] == len(written)


def test_panels_of_the_dashboard_are_queries(prometheus):
    dashboard = json.loads(DASHBOARD.read_text(encoding="utf-8"))
    assert len(dashboard["panels"]) == 13
    for panel in dashboard["panels"]:
        for target in panel["targets"]:
            prometheus.query(target["expr"].replace("$instance", ".*"))
    names = {variable["name"] for variable in dashboard["templating"]["list"]}
    assert set(re.findall(r"\$\{?(\w+)", json.dumps(dashboard))) <= names


def test_queries_of_the_docs(prometheus, host):
    """Each is a query, and those about what is have an answer."""
    run_of_one_card(host, output=prometheus.textfiles / "assay.prom")
    until(lambda: prometheus.query("assay_device_info"), "the run isn't scraped")
    blocks = re.findall(r"^```promql\n(.*?)^```$", DOCS.read_text(encoding="utf-8"), re.DOTALL | re.MULTILINE)
    queries = "".join(blocks).splitlines()
    assert len(queries) == 9
    found = {query: prometheus.query(query) for query in queries}
    assert {query for query in queries if found[query] == []} == {
        query for query in queries if re.search(r"offset|broken|86400|!=", query)}


def test_metrics_of_rules_and_dashboard_exist(host):
    known = set(re.findall(r"^# TYPE (\S+) gauge$", run_of_one_card(host).text, re.MULTILINE))
    for file in (RULES, DASHBOARD):
        used = set(re.findall(r"\bassay_\w+", file.read_text(encoding="utf-8")))
        assert used - known == set(), file
