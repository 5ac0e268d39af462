# SPDX-License-Identifier: MIT
"""Scans a folder of plug-ins on two machines at once, as docs/examples/many_machines/ shows it, and compares the merged
report with that of one machine.

    many_machines_test.py --scan build/release/vsttorture-scan --plugins build/release/plugins hosts|job_array

hosts: two hosts that GNU parallel reaches by ssh; takes parallel, ssh and sshd.
job_array: two nodes of a Slurm cluster; takes slurmctld, slurmd, sbatch and munged.

A machine is a process with a host name and a view of the file system of its own: its home, its programs and its copies
of the plug-ins, at the same paths as those of the other machines. Nothing of this is seen outside these processes, and
nothing of the system's is written to; the network is not used, except for loopback between Slurm's daemons.

Takes the rights of root for that. Exits with 77 when they or a program are missing; a missing program is a failure if
VSTTORTURE_MANY_MACHINES=required is in the environment.
"""
import argparse
import json
import os
import pathlib
import pwd
import shlex
import shutil
import signal
import socket
import subprocess
import sys
import tempfile
import time
import unittest

NOTHING_TO_RUN = 77
ROOT = pathlib.Path(__file__).resolve().parents[2]
EXAMPLES = ROOT / "docs/examples/many_machines"
TOOLS = {"hosts": ["parallel", "ssh", "ssh-keygen", "sshd"],
         "job_array": ["slurmctld", "slurmd", "sbatch", "munged"]}
SYSTEM_PATH = "/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin"
LIMIT_IN_SECONDS = 120
SCAN = PLUGINS = None  # From the command line.

# Becomes a machine: a name, a folder that every machine has at the same path, and a command to go on with. The folder
# holds home/, bin/ and plugins/. sshd looks into /etc/passwd for the home, and wants a folder /run/sshd.
ENTER_MACHINE = """
set -e
name=$1 folder=$2 seen_as=$3
shift 3
hostname "$name"
mount --bind "$folder" "$seen_as"
mount --bind "$folder/passwd" /etc/passwd
mount -t tmpfs none /run
mkdir /run/sshd
exec "$@"
"""

# What differs from scan to scan of the same plug-ins: times, and the tests that are drawn at random for the steps
# behind this one.
OF_THE_MOMENT = {"time", "wallSeconds", "userSeconds", "systemSeconds", "seconds", "start", "peakMemoryInBytes",
                 "outputBytes", "tests"}
LAST_FIXED_STEP = 15


def shell_words(*words):
    return " ".join(shlex.quote(str(word)) for word in words)


def timeless(value):
    """The value without what differs from scan to scan."""
    if isinstance(value, dict):
        if value.keys() >= {"number", "text"} and value["number"] > LAST_FIXED_STEP:
            value = {**value, "text": "drawn"}
        return {key: timeless(item) for key, item in value.items() if key not in OF_THE_MOMENT}
    if isinstance(value, list):
        return [timeless(item) for item in value]
    return value


def read_events(text):
    return [json.loads(line) for line in text.splitlines()]


def results(events):
    """What a report says of each plug-in and child, by name."""
    found = {}
    for event in events:
        if event["event"] == "plugin_ended":
            name = f"{event['plugin']['bundle']} {event['plugin']['child']}"
            assert name not in found, name
            found[name] = timeless(event)
    return found


class ManyMachines(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory(prefix="vsttorture-machines-")
        self.addCleanup(folder.cleanup)
        self.folder = pathlib.Path(folder.name)
        self.folder.chmod(0o755)  # munged insists.
        self.seen_as = self.folder / "machine"
        self.seen_as.mkdir()
        self.output = self.folder / "results"
        # Without a cache: what changed since an earlier scan is a matter of each machine.
        self.arguments = ["--cache", "off", self.seen_as / "plugins"]
        self.user = pwd.getpwuid(os.getuid()).pw_name

    def make_machine(self, name):
        """Returns the command that goes before another one to run it on this machine."""
        machine = self.folder / name
        for part in ("home", "bin"):
            (machine / part).mkdir(parents=True)
        (machine / "plugins").mkdir()
        for plugin in PLUGINS.glob("*.so"):
            if plugin.name != "crashes_after_two_states.so":  # Only with some of the tests that are drawn.
                shutil.copy(plugin, machine / "plugins")
        (machine / "bin/vsttorture-scan").symlink_to(SCAN)
        (machine / "passwd").write_text(
            "".join(self.with_home(line) for line in pathlib.Path("/etc/passwd").read_text().splitlines(keepends=True)))
        return ["unshare", "--uts", "--mount", "sh", "-c", ENTER_MACHINE, "sh", name, machine, self.seen_as]

    def with_home(self, line):
        fields = line.split(":")
        if fields[0] == self.user:
            fields[5] = str(self.seen_as / "home")
        return ":".join(fields)

    def environment(self, **more):
        return {"HOME": str(self.seen_as / "home"), "PATH": f"{self.seen_as}/bin:{SYSTEM_PATH}", "LC_ALL": "C",
                "USER": self.user, **{name: str(value) for name, value in more.items()}}

    def run_here(self, *command, status=0, **more):
        done = subprocess.run([str(word) for word in command], stdin=subprocess.DEVNULL, capture_output=True, text=True,
                              timeout=LIMIT_IN_SECONDS, check=False, **{"env": self.environment(), **more})
        self.assertEqual(done.returncode, status, f"{command}\n{done.stdout}\n{done.stderr}")
        return done

    def one_machine(self):
        """The events of a scan of everything on a machine of its own."""
        machine = self.make_machine("alone")
        arguments = ["--quiet", "--json", "-", *self.arguments]
        return read_events(self.run_here(*machine, "vsttorture-scan", *arguments, status=1).stdout)

    def check_merged(self, one, machines):
        """The parts come from these machines; merged they say what the scan of one machine says."""
        parts = sorted(self.output.glob("part-*.jsonl"))
        streams = [read_events(part.read_text()) for part in parts]
        self.assertEqual({stream[0]["machine"] for stream in streams}, machines)
        for stream in streams:
            self.assertEqual(stream[-1]["event"], "scan_ended")
        merged = read_events(self.run_here(SCAN, "report", "--json", "-", *parts, status=1).stdout)
        found, expected = results(merged), results(one)
        self.assertEqual(sorted(found), sorted(expected))
        for name, result in expected.items():
            with self.subTest(plugin=name):
                self.assertEqual(found[name], result)
        self.assertEqual(merged[-1]["counts"], one[-1]["counts"])
        self.assertEqual((merged[-1]["unwanted"], merged[-1]["status"]), (one[-1]["unwanted"], 1))


class Hosts(ManyMachines):
    def setUp(self):
        super().setUp()
        keys = self.folder / "keys"
        keys.mkdir(mode=0o700)
        for name in ("host_key", "user_key"):
            self.run_here("ssh-keygen", "-q", "-t", "ed25519", "-N", "", "-f", keys / name, env=os.environ)
        (self.folder / "sshd_config").write_text(
            f"HostKey {keys}/host_key\nAuthorizedKeysFile {keys}/user_key.pub\nStrictModes no\nUsePAM no\n"
            f"PermitRootLogin yes\nPidFile none\nSetEnv PATH={self.seen_as}/bin:{SYSTEM_PATH}\n")
        (self.folder / "known_hosts").write_text(f"host* {(keys / 'host_key.pub').read_text()}")
        self.ssh = self.folder / "ssh"
        self.ssh.write_text(f'#!/bin/sh\nexec ssh -F {self.folder}/ssh_config "$@"\n')
        self.ssh.chmod(0o755)
        # sshd serves one connection on its standard input and output, on the machine.
        server = [shutil.which("sshd", path=SYSTEM_PATH), "-i", "-f", self.folder / "sshd_config"]
        rows = [f"IdentityFile {keys}/user_key", f"UserKnownHostsFile {self.folder}/known_hosts", "BatchMode yes"]
        for host in ("host1", "host2"):
            rows += [f"Host {host}", f"ProxyCommand {self.folder}/{host}.connect"]
            connect = self.folder / f"{host}.connect"
            connect.write_text(f"#!/bin/sh\nexec {shell_words(*self.make_machine(host), *server)}\n")
            connect.chmod(0o755)
        (self.folder / "ssh_config").write_text("\n".join(rows) + "\n")
        self.one = self.one_machine()

    def scan_on_hosts(self, **more):
        environment = self.environment(PARALLEL_SSH=self.ssh, PARALLEL_HOME=self.folder / "parallel",
                                       TMPDIR=self.folder)
        environment["PATH"] = f"{self.folder}/alone/bin:{SYSTEM_PATH}"
        return self.run_here(EXAMPLES / "scan_on_hosts.sh", "host1,host2", "4", self.output, *self.arguments,
                             env=environment, **more)

    def test_the_merged_report_of_two_hosts_is_that_of_one(self):
        report = self.scan_on_hosts(status=1).stdout
        self.assertIn(f"{sum(self.one[-1]['counts'].values())} results: ", report)
        self.check_merged(self.one, {"host1", "host2"})

    def test_the_parts_of_a_host_that_cannot_be_reached_are_scanned_by_the_other(self):
        (self.folder / "host2.connect").write_text("#!/bin/sh\nexit 1\n")
        self.scan_on_hosts(status=1)
        self.check_merged(self.one, {"host1"})

    def test_a_part_that_no_host_could_scan_is_said(self):
        for host in ("host1", "host2"):
            (self.folder / f"{host}.connect").write_text("#!/bin/sh\nexit 1\n")
        errors = self.scan_on_hosts(status=3).stderr
        self.assertIn("scan_on_hosts.sh: 4 of 4 parts could not be scanned", errors)


def free_ports(count):
    """Ports of loopback that nobody listens on."""
    sockets = [socket.socket() for _ in range(count)]
    for listener in sockets:
        listener.bind(("127.0.0.1", 0))
    ports = [listener.getsockname()[1] for listener in sockets]
    for listener in sockets:
        listener.close()
    return ports


class JobArray(ManyMachines):
    NODES = ("node1", "node2")

    def setUp(self):
        super().setUp()
        self.logs = self.folder / "logs"
        self.logs.mkdir()
        for name in ("state", "spool-node1", "spool-node2"):
            (self.folder / name).mkdir()
        self.environment_of_slurm = self.environment(SLURM_CONF=self.folder / "slurm.conf")
        self.write_configuration()
        self.daemons = []
        self.addCleanup(self.stop_daemons)
        self.start_cluster()

    def write_configuration(self):
        control, *nodes = free_ports(1 + len(self.NODES))
        rows = {"ClusterName": "test", "SlurmctldHost": f"{socket.gethostname().partition('.')[0]}(127.0.0.1)",
                "SlurmUser": self.user, "SlurmdUser": self.user, "AuthType": "auth/munge",
                "AuthInfo": f"socket={self.folder}/munge.socket", "SlurmctldPort": control,
                "StateSaveLocation": self.folder / "state", "SlurmdSpoolDir": self.folder / "spool-%n",
                "SlurmctldPidFile": self.folder / "slurmctld.pid", "SlurmdPidFile": self.folder / "slurmd-%n.pid",
                "ProctrackType": "proctrack/linuxproc", "TaskPlugin": "task/none", "SwitchType": "switch/none",
                "MpiDefault": "none", "JobAcctGatherType": "jobacct_gather/none", "PlugStackConfig": "/dev/null",
                "SelectType": "select/cons_tres", "SelectTypeParameters": "CR_CPU",
                "SlurmdParameters": "config_overrides", "KillWait": 5}
        lines = [f"{name}={value}" for name, value in rows.items()]
        for node, port in zip(self.NODES, nodes):
            lines.append(f"NodeName={node} NodeHostname={node} NodeAddr=127.0.0.1 Port={port} CPUs=2")
        lines.append("PartitionName=all Nodes=ALL Default=YES State=UP")
        (self.folder / "slurm.conf").write_text("\n".join(lines) + "\n")

    def start_daemon(self, name, *command):
        with open(self.logs / name, "wb") as log:
            self.daemons.append(subprocess.Popen([str(word) for word in command], env=self.environment_of_slurm,
                                                 stdin=subprocess.DEVNULL, stdout=log, stderr=log,
                                                 start_new_session=True))

    def start_cluster(self):
        key = self.folder / "munge.key"
        key.write_bytes(os.urandom(128))
        key.chmod(0o400)
        self.start_daemon("munged", "munged", "--foreground", "--socket", self.folder / "munge.socket",
                          "--key-file", key, "--pid-file", self.folder / "munged.pid",
                          "--seed-file", self.folder / "munge.seed", "--num-threads", "2")
        self.wait_until("munged answers", lambda: (self.folder / "munge.socket").exists())
        self.start_daemon("slurmctld", "slurmctld", "-D", "-i")
        for node in self.NODES:
            self.start_daemon(node, *self.make_machine(node), "slurmd", "-D", "-N", node)
        self.wait_until("both nodes are idle", lambda: self.slurm("sinfo", "--noheader", "--format", "%D %T") ==
                        "2 idle\n")

    def stop_daemons(self):
        for daemon in reversed(self.daemons):
            daemon.send_signal(signal.SIGTERM)
        for daemon in self.daemons:
            try:
                daemon.wait(20)
            except subprocess.TimeoutExpired:
                os.killpg(daemon.pid, signal.SIGKILL)
                daemon.wait()

    def slurm(self, *command):
        return subprocess.run(command, env=self.environment_of_slurm, stdin=subprocess.DEVNULL, text=True,
                              capture_output=True, timeout=LIMIT_IN_SECONDS, check=False).stdout

    def wait_until(self, what, holds):
        deadline = time.monotonic() + 60
        while not holds():
            ended = [daemon.args[0] for daemon in self.daemons if daemon.poll() is not None]
            if ended or time.monotonic() > deadline:
                logs = "\n".join(f"{log.name}:\n{log.read_text()}" for log in sorted(self.logs.iterdir()))
                self.fail(f"not so: {what}; ended: {ended}\n{logs}")
            time.sleep(0.1)

    def test_the_merged_report_of_a_job_array_is_that_of_one_machine(self):
        one = self.one_machine()
        self.run_here("sbatch", "--wait", "--array=1-4", "--output", self.logs / "task-%a", EXAMPLES / "scan_array.sh",
                      self.output, *self.arguments, env=self.environment_of_slurm, cwd=self.folder)
        self.check_merged(one, set(self.NODES))


def main():
    global SCAN, PLUGINS
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", required=True, type=pathlib.Path)
    parser.add_argument("--plugins", required=True, type=pathlib.Path)
    parser.add_argument("kind", choices=TOOLS)
    options = parser.parse_args()
    SCAN, PLUGINS = options.scan.resolve(), options.plugins.resolve()
    missing = [tool for tool in TOOLS[options.kind] if not shutil.which(tool, path=SYSTEM_PATH)]
    if missing:
        print(f"left out: {' and '.join(missing)} not installed")
        return 1 if os.environ.get("VSTTORTURE_MANY_MACHINES") == "required" else NOTHING_TO_RUN
    if subprocess.run(["unshare", "--uts", "--mount", "mount", "-t", "tmpfs", "none", "/run"], capture_output=True,
                      check=False).returncode != 0:
        print("left out: machines cannot be simulated without the right to make namespaces and to mount")
        return NOTHING_TO_RUN
    if options.kind == "job_array" and not any(pathlib.Path("/sys/fs/cgroup").glob("*")):
        print("left out: slurmd does not start where nothing is mounted on /sys/fs/cgroup")
        return NOTHING_TO_RUN
    suite = unittest.defaultTestLoader.loadTestsFromTestCase({"hosts": Hosts, "job_array": JobArray}[options.kind])
    return 0 if unittest.TextTestRunner(verbosity=2).run(suite).wasSuccessful() else 1


if __name__ == "__main__":
    sys.exit(main())
