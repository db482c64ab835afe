#!/usr/bin/env python3
"""Runs the job-array script on a private one-node Slurm.

Starts munged, slurmctld and slurmd in a temporary folder (their own key,
socket, ports, state and logs; no cgroups), submits an array of four imports
of generated products, and checks every product's outputs against the
generator's truth: the list file, each sub-swath raster's size, its ENVI
header and its ".sml" header read with Python's XML parser, the run's own
process log and the summary line.  Every wait is bounded; the daemons are
stopped by their process ids on every way out.
"""
import argparse
import os
import re
import shutil
import signal
import socket
import subprocess
import sys
import tempfile
import time
import xml.etree.ElementTree as ET

PRODUCTS = 4
SUB_SWATHS = 5
LINE_PREFIX = 17  # time and quality bytes ahead of every raster line
SAMPLE_BYTES = 8  # complex float
DEADLINE = 420  # seconds for the whole test, below the ctest timeout
DAEMONS = ["munged", "slurmctld", "slurmd"]
CLIENTS = ["sbatch", "squeue", "sinfo", "scancel", "flock"]


class Failure(Exception):
    pass


def deadline_reached(signum, frame):
    raise Failure("stopped by signal %d" % signum)


def free_port():
    with socket.socket() as s:
        s.bind(("127.0.0.1", 0))
        return s.getsockname()[1]


def read_params(path):
    params, section = {}, None
    with open(path) as f:
        for line in f:
            line = line.strip()
            if line.startswith("[") and line.endswith("]"):
                section = params.setdefault(line[1:-1], {})
            elif "=" in line and section is not None:
                key, value = line.split("=", 1)
                section[key.strip()] = value.strip()
    return params


def sml_fields(path, wanted):
    fields = {}
    for e in ET.parse(path).getroot().iter():
        tag = e.tag.split("}")[-1]
        if tag in wanted and tag not in fields:
            values = [v.text or "" for v in e.iter() if v.tag.split("}")[-1].endswith("Value")]
            fields[tag] = values[0] if values else (e.text or "").strip()
    return fields


def wait_for(what, predicate, seconds):
    end = time.time() + seconds
    while time.time() < end:
        if predicate():
            return
        time.sleep(0.5)
    raise Failure("timed out after %d s waiting for %s" % (seconds, what))


class Cluster:
    """munged, slurmctld and slurmd of one node, all under one folder."""

    def __init__(self, folder):
        self.folder = folder
        self.processes = []
        self.env = dict(os.environ, SLURM_CONF=os.path.join(folder, "slurm.conf"))

    def path(self, name):
        return os.path.join(self.folder, name)

    def start(self):
        user = subprocess.run(["id", "-un"], capture_output=True, text=True).stdout.strip()
        host = socket.gethostname().split(".")[0]
        cpus = os.cpu_count() or 1
        with open("/proc/meminfo") as f:
            memory_kb = int(re.search(r"MemTotal:\s+(\d+)", f.read()).group(1))
        for d in ("munge", "spool", "state"):
            os.makedirs(self.path(d), mode=0o700)
        key = self.path("munge/munge.key")
        with open(key, "wb") as f:
            f.write(os.urandom(1024))
        os.chmod(key, 0o400)
        socket_path = self.path("munge/munge.socket")
        self.spawn("munged", ["munged", "--foreground", "--force", "--key-file=" + key,
                              "--socket=" + socket_path,
                              "--pid-file=" + self.path("munge/munged.pid"),
                              "--log-file=" + self.path("munge/munged.log"),
                              "--seed-file=" + self.path("munge/munged.seed")])
        wait_for("the munge socket", lambda: os.path.exists(socket_path), 20)
        conf = "\n".join([
            "ClusterName=local",
            "SlurmctldHost=%s" % host,
            "SlurmctldPort=%d" % free_port(),
            "SlurmdPort=%d" % free_port(),
            "AuthType=auth/munge",
            "AuthInfo=socket=%s" % socket_path,
            "CredType=cred/munge",
            "ProctrackType=proctrack/linuxproc",
            "TaskPlugin=task/none",
            "JobAcctGatherType=jobacct_gather/none",
            "SchedulerType=sched/backfill",
            "SelectType=select/cons_tres",
            "SelectTypeParameters=CR_Core",
            "MailProg=/bin/true",
            "SlurmUser=%s" % user,
            "SlurmdUser=%s" % user,
            "SlurmctldPidFile=%s" % self.path("slurmctld.pid"),
            "SlurmdPidFile=%s" % self.path("slurmd.pid"),
            "SlurmdSpoolDir=%s" % self.path("spool"),
            "StateSaveLocation=%s" % self.path("state"),
            "SlurmctldLogFile=%s" % self.path("slurmctld.log"),
            "SlurmdLogFile=%s" % self.path("slurmd.log"),
            "ReturnToService=2",
            "NodeName=%s CPUs=%d RealMemory=%d State=UNKNOWN" % (host, cpus, memory_kb // 2048),
            "PartitionName=main Nodes=%s Default=YES MaxTime=INFINITE State=UP" % host,
        ]) + "\n"
        with open(self.env["SLURM_CONF"], "w") as f:
            f.write(conf)
        self.spawn("slurmctld", ["slurmctld", "-D", "-i"])
        self.spawn("slurmd", ["slurmd", "-D"])
        wait_for("the node to be idle", self.node_idle, 60)

    def spawn(self, name, argv):
        log = open(self.path(name + ".stdout"), "w")
        p = subprocess.Popen(argv, env=self.env, stdout=log, stderr=subprocess.STDOUT,
                             stdin=subprocess.DEVNULL, start_new_session=True)
        log.close()
        self.processes.append((name, p))
        time.sleep(0.5)
        if p.poll() is not None:
            raise Failure("%s ended at start with status %d" % (name, p.returncode))

    def run(self, argv, **kwargs):
        return subprocess.run(argv, env=self.env, capture_output=True, text=True, timeout=30,
                              **kwargs)

    def node_idle(self):
        r = self.run(["sinfo", "-h", "-o", "%t"])
        return r.returncode == 0 and r.stdout.strip() == "idle"

    def job_running(self, job):
        r = self.run(["squeue", "-h", "-j", job])
        return r.returncode == 0 and r.stdout.strip() != ""

    def steps_left(self):
        # Every job step's slurmstepd keeps a socket "<node>_<job>.<step>" in
        # the spool folder until it has ended.
        return any(re.search(r"_\d+\.", n) for n in os.listdir(self.path("spool")))

    def stop(self):
        # Newest first: slurmd, slurmctld, then munged; each by its own id.
        for name, p in reversed(self.processes):
            if p.poll() is None:
                p.send_signal(signal.SIGTERM)
                try:
                    p.wait(timeout=15)
                except subprocess.TimeoutExpired:
                    p.kill()
                    p.wait(timeout=15)
        self.processes = []

    def logs(self):
        text = ""
        for name in ("slurmctld.log", "slurmd.log", "munge/munged.log"):
            try:
                with open(self.path(name)) as f:
                    text += "---- %s (last lines)\n%s" % (name, "".join(f.readlines()[-15:]))
            except OSError:
                pass
        return text


def generate(synth, folder):
    """Four products with their truth in one folder, with one orbit and one
    pair of auxiliary files (the same for every seed and pass)."""
    products = os.path.join(folder, "products")
    os.makedirs(products)
    made = []
    for i in range(PRODUCTS):
        out = os.path.join(folder, "gen%d" % i)
        options = ["--seed", str(i + 1), "--pass", "ascending" if i % 2 else "descending"]
        r = subprocess.run([synth, "--out", out, "--size", "tiny"] + options,
                           capture_output=True, text=True, timeout=120)
        if r.returncode != 0:
            raise Failure("the generator failed: " + r.stderr)
        truth = read_params(os.path.join(out, "synth_truth.txt"))
        scene = truth["Scene"]
        if i == 0:
            for key in ("OrbitFile", "XcaFile", "InsFile"):
                shutil.copy(os.path.join(out, scene[key]), products)
            orbit = os.path.join(products, scene["OrbitFile"])
        elif scene["OrbitFile"] != os.path.basename(orbit):
            raise Failure("the products follow different orbit files")
        # ESA names carry the sensing start; two products of one start are
        # told apart by a number.
        name = [n for n in os.listdir(out) if n.startswith("ASA_WSS")][0]
        product = os.path.join(products, "%s_%d.N1" % (name[:-3], i))
        shutil.move(os.path.join(out, name), product)
        made.append((product, orbit, truth))
    return products, made


def check_product(outdir, product, truth):
    name = os.path.basename(product)[:-3]
    root = os.path.join(outdir, name, name)
    with open(root) as f:
        listed = f.read()
    expected = "".join("%s%d_slc\n" % (root, k) for k in range(1, SUB_SWATHS + 1))
    if listed != expected:
        raise Failure("%s: list file %r, expected %r" % (name, listed, expected))
    for k in range(1, SUB_SWATHS + 1):
        s = truth["SubSwath%d" % k]
        samples, records = int(s["Samples"]), int(s["Records"])
        raster = "%s%d_slc" % (root, k)
        size = os.path.getsize(raster)
        if size != records * (LINE_PREFIX + SAMPLE_BYTES * samples):
            raise Failure("%s: %d bytes for %d lines of %d samples" % (raster, size, records,
                                                                      samples))
        with open(raster + ".vrt") as f:
            vrt = f.read()
        if 'rasterXSize="%d" rasterYSize="%d"' % (samples, records) not in vrt:
            raise Failure("%s.vrt does not state %d x %d" % (raster, samples, records))
        f = sml_fields(raster + ".sml", {"NrOfLinesPerImage", "NrOfPixelsPerLine"})
        if (float(f.get("NrOfLinesPerImage", "nan")) != records or
                float(f.get("NrOfPixelsPerLine", "nan")) != samples):
            raise Failure("%s.sml states %s" % (raster, f))
    with open(root + ".log") as f:
        log = f.read()
    if log.count("\nSTART : ") != 1 or "\n\nSUCCESSFUL\n\n" not in log or product not in log:
        raise Failure("%s.log does not hold exactly this run:\n%s" % (root, log))
    return root


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("--tool", required=True)
    parser.add_argument("--synth", required=True)
    parser.add_argument("--script", required=True)
    args = parser.parse_args()

    missing = [p for p in DAEMONS + CLIENTS if shutil.which(p) is None and
               not os.path.exists(os.path.join("/usr/sbin", p))]
    if missing:
        print("FAILED: missing %s; scripts/setup-packages installs slurm-wlm and munge"
              % ", ".join(missing))
        return 1
    os.environ["PATH"] += os.pathsep + "/usr/sbin"

    signal.signal(signal.SIGTERM, deadline_reached)
    signal.signal(signal.SIGALRM, deadline_reached)
    signal.alarm(DEADLINE)
    folder = tempfile.mkdtemp(prefix="vlr_slurm_")
    cluster = Cluster(os.path.join(folder, "cluster"))
    os.makedirs(cluster.folder)
    job = None
    try:
        products, made = generate(args.synth, folder)
        listing = os.path.join(folder, "products.txt")
        with open(listing, "w") as f:
            f.write("# product orbit\n")
            for product, orbit, _ in made:
                f.write("%s %s\n\n" % (product, orbit))
        outdir = os.path.join(folder, "out")
        os.makedirs(outdir)

        cluster.start()
        cluster.env["IMPORT_WSS"] = args.tool
        r = cluster.run(["sbatch", "--parsable", "--array=1-%d" % PRODUCTS, "--chdir", folder,
                         args.script, listing, outdir, "import", "--aux-dir", products])
        if r.returncode != 0:
            raise Failure("sbatch failed: " + r.stderr)
        job = r.stdout.strip().split(";")[0]
        wait_for("job %s to end" % job, lambda: not cluster.job_running(job), 300)
        job = None
        wait_for("the job steps to end", lambda: not cluster.steps_left(), 30)

        with open(os.path.join(outdir, "summary.tsv")) as f:
            summary = [line.rstrip("\n").split("\t") for line in f]
        if sorted(int(s[0]) for s in summary) != list(range(1, PRODUCTS + 1)):
            raise Failure("summary lines: %s" % summary)
        for task, product, result, status, seconds, root in summary:
            if result != "ok" or status != "0":
                with open(root + ".out") as f:
                    raise Failure("task %s: %s %s\n%s" % (task, result, status, f.read()))
        by_product = {s[1]: s[5] for s in summary}
        for product, _, truth in made:
            if check_product(outdir, product, truth) != by_product.get(product):
                raise Failure("%s: summary names another output root" % product)
        print("four imports through the job array: complete and as the generator states")
        return 0
    except (Failure, OSError, subprocess.SubprocessError, KeyError, ValueError) as e:
        print("FAILED: %s" % e)
        print(cluster.logs())
        return 1
    finally:
        signal.alarm(0)
        if job is not None:
            try:
                cluster.run(["scancel", job])
                wait_for("job %s to be cancelled" % job, lambda: not cluster.job_running(job), 30)
                wait_for("the job steps to end", lambda: not cluster.steps_left(), 30)
            except (Failure, OSError, subprocess.SubprocessError):
                pass
        cluster.stop()
        shutil.rmtree(folder, ignore_errors=True)


if __name__ == "__main__":
    sys.exit(main())
