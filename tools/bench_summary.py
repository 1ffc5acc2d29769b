#!/usr/bin/env python3
"""One table of the 12 MP benchmarks of ./run bench.

usage: bench_summary.py ONE_THREAD_DIR TWO_THREAD_DIR [OUT.md]

Each directory holds one Google Benchmark JSON file per program (NAME.json).
Every benchmark whose first numeric argument is 12 is listed with its time
and its multiple of the same program's Memcpy/12 from the same run (the
median where the run was repeated)."""
import json
import os
import sys


def times(path):
    """{label: ms} of the 12 MP benchmarks in one JSON file."""
    with open(path) as f:
        runs = json.load(f).get("benchmarks", [])
    repeated = any(r.get("run_type") == "aggregate" for r in runs)
    scale = {"ns": 1e-6, "us": 1e-3, "ms": 1.0, "s": 1e3}
    out = {}
    for r in runs:
        if repeated and r.get("aggregate_name") != "median":
            continue
        if "error_message" in r:
            continue
        parts = r.get("run_name", r["name"]).split("/")
        numbers = [i for i, p in enumerate(parts) if p.isdigit()]
        if not numbers or parts[numbers[0]] != "12":
            continue
        label = "/".join(p for i, p in enumerate(parts) if i != numbers[0] and p != "real_time")
        out[label] = r["real_time"] * scale[r.get("time_unit", "ns")]
    return out


def main():
    one_dir, two_dir = sys.argv[1], sys.argv[2]
    programs = sorted(f[:-5] for f in os.listdir(one_dir) if f.endswith(".json"))
    rows = ["| operation | ms 1 thread | × memcpy | ms 2 threads | × memcpy |", "|---|---:|---:|---:|---:|"]
    for prog in programs:
        runs = []
        for d in (one_dir, two_dir):
            path = os.path.join(d, prog + ".json")
            runs.append(times(path) if os.path.exists(path) else {})
        memcpy = [next((t for k, t in r.items() if k in ("Memcpy", "BM_Memcpy")), None) for r in runs]
        labels = sorted(set(runs[0]) | set(runs[1]), key=lambda k: (k not in ("Memcpy", "BM_Memcpy"), k))
        for label in labels:
            cells = []
            for r, m in zip(runs, memcpy):
                t = r.get(label)
                cells += ["" if t is None else f"{t:.1f}", "" if t is None or not m else f"{t / m:.1f}"]
            rows.append(f"| {prog.removeprefix('bench_')}: {label} | " + " | ".join(cells) + " |")
    text = "\n".join(rows) + "\n"
    sys.stdout.write(text)
    if len(sys.argv) > 3:
        with open(sys.argv[3], "w") as f:
            f.write(text)


if __name__ == "__main__":
    main()
