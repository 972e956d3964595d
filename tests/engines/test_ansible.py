"""The local fact of Ansible: collected on this machine, and hosts chosen by it."""

import json
import os
import subprocess

import pytest

from engines import INTEGRATIONS, needed, outcome_of
from hosting import host_run, run_assay
from model import Gpu

FACT = INTEGRATIONS / "ansible" / "assay.fact"

PLAYBOOK = """\
- hosts: all
  gather_facts: false
  tasks:
    - setup:
        fact_path: "{{ facts }}"
        gather_subset: ["!all", "!min", local]
    - group_by:
        key: "opengl_{{ ansible_local.assay.opengl.usable | default('not_tested') }}"
- hosts: opengl_hardware
  gather_facts: false
  tasks:
    - copy: {content: "works", dest: "{{ facts }}/chosen"}
"""


def fact_of(environment):
    run = subprocess.run([FACT], env=environment, stdout=subprocess.PIPE, check=True)
    return json.loads(run.stdout)


def test_fact_is_the_stored_one_or_empty(tmp_path):
    stored = tmp_path / "facts.json"
    environment = {**os.environ, "ASSAY_FACTS": str(stored)}
    assert fact_of(environment) == {}
    stored.write_bytes(host_run("run", "--format", "ansible").out)
    assert fact_of(environment)["verdict"] == "complete"


def test_fact_passes_shellcheck():
    assert outcome_of(needed("shellcheck"), FACT) == (0, "")


@pytest.fixture(name="machines")
def fixture_machines(host, tmp_path):
    """Folders of local facts: of a machine that works, of one whose driver crashes, and of one that
    was never tested."""
    folders = {}
    for name, rules in (("works", ""), ("crashes", "at glCompileShader crash\n"), ("new", None)):
        folder = tmp_path / name
        folder.mkdir()
        if rules is not None:
            gpu = Gpu(renderer="Accelerator")
            run_assay(host, "--format", "ansible", "--output", str(folder / "facts.json"),
                      machine={"script": gpu.script() + rules})
        (folder / "assay.fact").write_text(
            f"#!/bin/sh\nASSAY_FACTS={folder}/facts.json exec {FACT}\n", encoding="utf-8")
        (folder / "assay.fact").chmod(0o755)
        folders[name] = folder
    return folders


def test_hosts_are_chosen_by_the_fact(machines, tmp_path):
    inventory = tmp_path / "inventory"
    inventory.write_text("".join(
        f"{name} ansible_connection=local ansible_python_interpreter=/usr/bin/python3 facts={folder}\n"
        for name, folder in machines.items()), encoding="utf-8")
    playbook = tmp_path / "playbook.yml"
    playbook.write_text(PLAYBOOK, encoding="utf-8")
    status, text = outcome_of(
        needed("ansible-playbook"), "-i", inventory, playbook,
        env={**os.environ, "ANSIBLE_HOME": str(tmp_path / "ansible"), "LC_ALL": "C.UTF-8",
             "ANSIBLE_LOCAL_TEMP": str(tmp_path / "local"), "ANSIBLE_NOCOLOR": "1"})
    assert status == 0, text
    assert {name: (folder / "chosen").exists() for name, folder in machines.items()} == {
        "works": True, "crashes": False, "new": False}
