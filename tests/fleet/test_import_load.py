"""velmora-import-logcat --load: record-load's lines merged into the imported trace by time on
the log's clock, those before the first call folded into one at @0; a bad load file, a log
without a clock to share and a clock mismatch are one-line refusals naming the file (and line),
exit status 1, no trace written."""
import pytest

from conftest import run, tool

PREFIX = "  1234  1250 I velmora server: "
LOG = "".join("%s%s%s\n" % (stamp, PREFIX, msg) for stamp, msg in [
    ("1795457370.100", "velmoraEvent cmdId=4099, payload=0"),
    ("1795457372.100", "velmoraEvent cmdId=4101, payload=0"),
    ("1795457375.100", "velmoraEvent cmdId=4102, payload=0"),
])
LOAD = """# record-load: clock=epoch interval=1000ms domains=cpu.little:0,1 cpu.big:2,3
@1795457369000 load cpu.little=0.10 cpu.big=0.05
@1795457370000 load cpu.little=0.20 cpu.big=0.05
@1795457371000 load cpu.little=0.30 cpu.big=0.40
@1795457372100 load cpu.little=0.50 cpu.big=0.60
@1795457377000 load cpu.big=1
"""


def import_log(tmp_path, load, log=LOG):
    (tmp_path / "session.log").write_text(log)
    (tmp_path / "load.txt").write_text(load)
    trace = tmp_path / "session.trace"
    result = run([tool("velmora-import-logcat"), str(tmp_path / "session.log"), "-o",
                  str(trace), "--load", str(tmp_path / "load.txt")])
    return result, trace


def calls(trace):
    return [line.split("#")[0].split() for line in trace.read_text().splitlines()
            if line.startswith("@")]


def test_load_lines_go_between_the_calls_by_time(tmp_path):
    result, trace = import_log(tmp_path, LOAD)
    assert result.returncode == 0, result.stderr
    assert calls(trace) == [
        ["@0", "load", "cpu.little=0.20", "cpu.big=0.05"],
        ["@0", "dump", "--logon"],
        ["@0", "event", "4099", "0"],
        ["@900", "load", "cpu.little=0.30", "cpu.big=0.40"],
        ["@2000", "load", "cpu.little=0.50", "cpu.big=0.60"],
        ["@2000", "event", "4101", "0"],
        ["@5000", "event", "4102", "0"],
        ["@6900", "load", "cpu.big=1"],
    ]


def test_monotonic_log_and_file(tmp_path):
    log = LOG.replace("1795457", "")
    load = LOAD.replace("clock=epoch", "clock=monotonic").replace("@1795457", "@")
    result, trace = import_log(tmp_path, load, log)
    assert result.returncode == 0, result.stderr
    assert calls(trace)[3] == ["@900", "load", "cpu.little=0.30", "cpu.big=0.40"]


@pytest.mark.parametrize("load, log, message", [
    ("@100 load cpu.big=1.5\n", LOG, "load.txt:1: load of cpu.big is not a number in [0, 1]"),
    ("# c\n@100 load cpu.big=-0.1\n", LOG, "load.txt:2: load of cpu.big"),
    ("@100 load\n", LOG, "load.txt:1: a load line without <id>=<u>"),
    ("@100 event 4099 0\n", LOG, "load.txt:1: not a load line"),
    ("100 load cpu.big=0.5\n", LOG, "load.txt:1: not a load line"),
    ("@100 load cpu big=0.5\n", LOG, "load.txt:1: 'cpu' is not <id>=<u>"),
    ("# nothing\n", LOG, "load.txt: no load lines"),
    (LOAD.replace("clock=epoch", "clock=monotonic"), LOG,
     "load.txt:1: load times on the monotonic clock, the log's are epoch"),
    (LOAD, LOG.replace("1795457370.100", "11-23 18:09:30.100").replace(
        "1795457372.100", "11-23 18:09:32.100").replace("1795457375.100", "11-23 18:09:35.100"),
     "dated stamps, no clock"),
])
def test_bad_load_input_is_refused(tmp_path, load, log, message):
    result, trace = import_log(tmp_path, load, log)
    assert result.returncode == 1
    assert message in result.stderr and result.stderr.count("\n") == 1, result.stderr
    assert not trace.exists()


def test_a_load_file_that_is_a_directory(tmp_path):
    (tmp_path / "session.log").write_text(LOG)
    result = run([tool("velmora-import-logcat"), str(tmp_path / "session.log"), "-o",
                  str(tmp_path / "t.trace"), "--load", str(tmp_path)])
    assert result.returncode == 1 and "is a directory" in result.stderr
