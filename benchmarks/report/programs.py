"""Builds the benchmark programs and runs them, pinned to one core and interleaved."""

import json
import os
import re
import shutil
import subprocess
import sys
import tempfile
from pathlib import Path

ROOT = Path(__file__).resolve().parent.parent.parent
BUILD = ROOT / "build" / "release"


def fail(message):
    sys.exit(f"bench: {message}")


def run(command, **options):
    return subprocess.run(command, check=False, **options)


def build_programs():
    """Builds the programs named bench_...; returns their paths."""
    environment = dict(os.environ)
    if shutil.which("ccache"):
        environment.setdefault("CMAKE_CXX_COMPILER_LAUNCHER", "ccache")
    configure = ["cmake", "--preset", "release", "-DTESSALY_BUILD_BENCHMARKS=ON"]
    result = run(configure, cwd=ROOT, env=environment, capture_output=True, text=True)
    if result.returncode != 0:
        fail(f"configuring failed\n{result.stdout}{result.stderr}")
    for line in result.stdout.splitlines():
        if line.startswith("-- bench_"):
            print(line[3:], file=sys.stderr)
    listing = run(
        ["cmake", "--build", str(BUILD), "--target", "help"], capture_output=True, text=True
    ).stdout
    targets = sorted(set(re.findall(r"^(bench_\w+):", listing, re.MULTILINE)))
    if not targets:
        fail("the release build has no target named bench_...")
    command = ["cmake", "--build", str(BUILD), "--target", *targets]
    result = run(command, capture_output=True, text=True)
    if result.returncode != 0:
        fail(f"building failed\n{result.stdout}{result.stderr}")
    return [BUILD / "bin" / target for target in targets]


def built_programs(folder):
    """Programs as they are in a folder."""
    return sorted(
        path for path in Path(folder).glob("bench_*") if path.is_file() and os.access(path, os.X_OK)
    )


def pinned_to(cpu):
    """The core that programs run on, None for any: without taskset nobody pins them."""
    return cpu if shutil.which("taskset") else None


def run_program(program, arguments):
    """Runs one program; returns the runs of Google Benchmark's report, one for each repetition."""
    environment = dict(os.environ)
    if arguments.against:
        environment["TESSALY_AGAINST"] = str(Path(arguments.against).resolve())
    data = ROOT / "build" / "data"
    if not environment.get("TESSALY_DATA") and data.is_dir():
        environment["TESSALY_DATA"] = str(data)
    with tempfile.TemporaryDirectory() as folder:
        report = Path(folder) / "report.json"
        command = [
            str(program),
            f"--benchmark_out={report}",
            "--benchmark_out_format=json",
            "--benchmark_enable_random_interleaving=true",
            f"--benchmark_repetitions={arguments.repetitions}",
            f"--benchmark_min_time={arguments.min_time}",
            f"--benchmark_filter={arguments.filter}",
        ]
        if pinned_to(arguments.cpu) is not None:
            command = ["taskset", "-c", str(arguments.cpu), *command]
        # To a file: a pipe's reader would wake up in the middle of what is timed.
        messages = Path(folder) / "messages.txt"
        with messages.open("wb") as stream:
            result = run(command, env=environment, stdout=subprocess.DEVNULL, stderr=stream)
        said = messages.read_text(encoding="utf-8", errors="replace").splitlines()
        if result.returncode != 0:
            last = "\n".join(said[-20:])
            fail(f"{program.name} ended with code {result.returncode}\n{last}")
        # What the program itself says; the library writes there too.
        for line in said:
            if line.startswith(f"{program.name}: "):
                print(line, file=sys.stderr)
        # With no benchmark left by the filter nothing is written.
        text = report.read_text(encoding="utf-8") if report.exists() else ""
        runs = json.loads(text)["benchmarks"] if text.strip() else []
        return [entry for entry in runs if entry.get("run_type") == "iteration"]


def machine(cpu, folder, built):
    """What the figures depend on besides the code. `built`: the programs are of this very state."""
    model = "unknown processor"
    if shutil.which("lscpu"):
        text = run(["lscpu"], capture_output=True, text=True, env={**os.environ, "LC_ALL": "C"})
        match = re.search(r"^Model name:\s*(.+)$", text.stdout, re.MULTILINE)
        model = match.group(1).strip() if match else model
    wide = []
    info = Path("/proc/cpuinfo")
    if info.exists():
        flags = re.search(r"^(?:flags|Features)\s*:(.*)$", info.read_text(), re.MULTILINE)
        words = flags.group(1).split() if flags else []
        known = ("sse2", "avx", "avx2", "fma", "avx512f", "avx512vl", "asimd", "neon")
        wide = [name for name in known if name in words]
    cache = Path(folder).parent / "CMakeCache.txt"
    cached = cache.read_text(encoding="utf-8") if cache.exists() else ""

    def entry(name):
        match = re.search(rf"^{name}:\w+=(.*)$", cached, re.MULTILINE)
        return match.group(1) if match else ""

    compiler = entry("CMAKE_CXX_COMPILER") or "c++"
    version = run([compiler, "--version"], capture_output=True, text=True).stdout.split("\n")[0]
    # Programs that are run as they are may be of any state.
    commit = "unknown"
    if built:
        describe = ["git", "describe", "--always", "--dirty", "--exclude=*"]
        commit = run(describe, cwd=ROOT, capture_output=True, text=True).stdout.strip()
    return {
        "processor": model,
        "cores": os.cpu_count(),
        "instructions": wide,
        "pinned_to": pinned_to(cpu),
        "load_average": os.getloadavg()[0],
        "compiler": version,
        "flags": f"{entry('CMAKE_CXX_FLAGS')} {entry('CMAKE_CXX_FLAGS_RELEASE')}".strip(),
        "commit": commit,
    }
