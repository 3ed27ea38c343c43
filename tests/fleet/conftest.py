"""Where the tools under test are: the build tree's tools/ (VELMORA_TOOLS) and the source tree
(VELMORA_SOURCE_DIR), both set by the CTest entries (tests/fleet/CMakeLists.txt)."""
import os
import subprocess

import pytest

TOOLS = os.environ.get("VELMORA_TOOLS", "")
SOURCE = os.environ.get("VELMORA_SOURCE_DIR",
                        os.path.dirname(os.path.dirname(os.path.dirname(__file__))))
EXAMPLES = os.path.join(SOURCE, "examples")
# A what-if configuration: a probed thread's boost asks for a higher big-cluster floor.
PROBE_A = "<big_min>1497600</big_min>"
PROBE_B = "<big_min>2419200</big_min>"


def tool(name):
    path = os.path.join(TOOLS, name)
    if not os.access(path, os.X_OK):
        pytest.fail("%s not built (VELMORA_TOOLS=%s)" % (name, TOOLS))
    return path


def run(args, **kwargs):
    return subprocess.run(args, capture_output=True, text=True, timeout=300, **kwargs)


def config_b(directory):
    """A copy of the example configuration whose probe boost raises the big cluster's floor
    to 2419200 kHz (1497600 in the example)."""
    text = open(os.path.join(EXAMPLES, "xml", "velmora_config_cust.xml")).read()
    assert PROBE_A in text
    os.makedirs(os.path.join(directory, "xml"), exist_ok=True)
    with open(os.path.join(directory, "xml", "velmora_config_cust.xml"), "w") as out:
        out.write(text.replace(PROBE_A, PROBE_B))
    return str(directory)


def synth(directory, count, duration_ms, seed=1):
    """velmora-synth sessions (with load lines) in `directory`."""
    args = [tool("velmora-synth"), "--seed", str(seed), "--count", str(count),
            "--duration-ms", str(duration_ms), "-o", str(directory)]
    subprocess.run(args, check=True, capture_output=True)
    return sorted(os.path.join(str(directory), f) for f in os.listdir(str(directory))
                  if f.startswith("session-"))
