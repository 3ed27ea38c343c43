"""velmora-fleet --scheduler on a real Dask cluster started here (a scheduler and two workers
on 127.0.0.1, stopped at the end whatever happens): the same fleet.json, byte for byte, as the
embedded local run."""
import os
import signal
import socket
import subprocess

import pytest

from conftest import EXAMPLES, config_b, run, synth, tool

pytest.importorskip("distributed")
PYTHON = "/usr/bin/python3"


def free_port():
    with socket.socket() as s:
        s.bind(("127.0.0.1", 0))
        return s.getsockname()[1]


def wait_for_workers(address, count, deadline):
    probe = ("import distributed, sys\n"
             "c = distributed.Client(sys.argv[1], timeout='5s')\n"
             "c.wait_for_workers(int(sys.argv[2]), timeout=%d)\n" % deadline)
    subprocess.run([PYTHON, "-c", probe, address, str(count)], check=True,
                   capture_output=True, timeout=deadline + 30)


@pytest.fixture
def cluster(tmp_path):
    port = free_port()
    address = "tcp://127.0.0.1:%d" % port
    common = dict(stdout=subprocess.DEVNULL, stderr=open(tmp_path / "cluster.log", "w"),
                  start_new_session=True, cwd=str(tmp_path))
    procs = [subprocess.Popen([PYTHON, "-m", "distributed.cli.dask_scheduler", "--host",
                               "127.0.0.1", "--port", str(port), "--dashboard-address", ":0",
                               "--no-show"], **common)]
    try:
        for n in range(2):
            procs.append(subprocess.Popen(
                [PYTHON, "-m", "distributed.cli.dask_worker", address, "--nworkers", "1",
                 "--nthreads", "1", "--no-nanny", "--dashboard-address", ":0",
                 "--local-directory", str(tmp_path / ("worker%d" % n))], **common))
        wait_for_workers(address, 2, 60)
        yield address
    finally:
        for proc in reversed(procs):
            if proc.poll() is None:
                os.killpg(proc.pid, signal.SIGTERM)
        for proc in procs:
            try:
                proc.wait(timeout=20)
            except subprocess.TimeoutExpired:
                os.killpg(proc.pid, signal.SIGKILL)
                proc.wait()


def test_a_dask_cluster_gives_the_local_fleet_json(cluster, tmp_path):
    sessions = tmp_path / "sessions"
    synth(sessions, 4, 20000, seed=7)
    (sessions / "corrupt.trace").write_bytes(b"@100 event 20225 0\n\x00\x01binary")
    b = config_b(tmp_path / "b")

    def fleet(out, *where):
        return run([tool("velmora-fleet"), "--config-dir", EXAMPLES, "--against", b,
                    "-o", str(tmp_path / out)] + list(where) + [str(sessions)])

    local = fleet("local")
    dask = fleet("dask", "--scheduler", cluster)
    assert local.returncode == 1 and dask.returncode == 1, dask.stderr
    local_json = (tmp_path / "local" / "fleet.json").read_bytes()
    assert (tmp_path / "dask" / "fleet.json").read_bytes() == local_json
    assert local_json.count(b'"status":"ok"') == 4
