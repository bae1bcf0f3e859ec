#!/usr/bin/env python3
"""Prints the benchmark table: medians of the repetitions and the ratios to the comparisons
measured in the same run, with the targets and whether each is met.

Usage: report.py RESULTS_DIR
RESULTS_DIR holds core.json, plugin-simulated.json and plugin-double.json (Google Benchmark's
JSON output with aggregates), memory.json (kest_resident_memory) and footprint.json
({"x86_64": bytes, "armhf": bytes or null}). Times are CPU time per operation.
"""
import json
import os
import sys


def load_medians(path):
    """Median CPU time in nanoseconds per benchmark name."""
    with open(path) as stream:
        data = json.load(stream)
    scale = {"ns": 1.0, "us": 1e3, "ms": 1e6, "s": 1e9}
    medians = {}
    for run in data["benchmarks"]:
        if run.get("run_type") == "aggregate" and run.get("aggregate_name") == "median":
            # A benchmark with its own minimum time carries it in its name; the table does not.
            name = "/".join(part for part in run["run_name"].split("/")
                            if not part.startswith("min_time:"))
            medians[name] = run["cpu_time"] * scale[run["time_unit"]]
    return medians


def duration(ns):
    if ns >= 1e6:
        return f"{ns / 1e6:.1f} ms"
    if ns >= 1e3:
        return f"{ns / 1e3:.2f} µs"
    return f"{ns:.1f} ns"


def verdict(met):
    return "yes" if met else "**no**"


def main():
    results = sys.argv[1]
    times = load_medians(os.path.join(results, "core.json"))
    times.update(load_medians(os.path.join(results, "plugin-simulated.json")))
    times.update(load_medians(os.path.join(results, "plugin-double.json")))
    with open(os.path.join(results, "memory.json")) as stream:
        memory = json.load(stream)
    with open(os.path.join(results, "footprint.json")) as stream:
        footprint = json.load(stream)

    rows = []

    def row(measure, kest, comparison, ratio, target, met):
        rows.append((measure, kest, comparison, ratio, target, met))

    for size, label in ((1024, "1 KB"), (102400, "100 KB"), (10485760, "10 MB")):
        own = times[f"IniText_Load/{size}"]
        inih = times[f"Inih_Load/{size}"]
        simple = times[f"SimpleIni_Load/{size}"]
        row(f"INI load {label}: `IniText_Load`", duration(own),
            f"inih {duration(inih)}; SimpleIni {duration(simple)}",
            f"{own / inih:.2f}× inih; {own / simple:.2f}× SimpleIni",
            "≤ 1.5× inih, < 1× SimpleIni",
            verdict(own <= 1.5 * inih and own < simple))
    own = times["IniText_Lookup"]
    simple = times["SimpleIni_Lookup"]
    row("INI key look-up, 100 KB document", duration(own), f"SimpleIni {duration(simple)}",
        f"{own / simple:.2f}×", "–", "–")
    own = times["GetStringFromIni_Cached"]
    floor = times["Stat_TimeZoneTable"]
    row("`GetStringFromIni`, cached unchanged file", duration(own),
        f"one `stat()` of the file {duration(floor)}", f"{own / floor:.2f}× the `stat()`",
        "< 1 µs", verdict(own < 1000))

    for operation in ("Set30", "Get30", "Enumerate30"):
        own = times[f"PropertyBag_{operation}"]
        floor = times[f"StdMap_{operation}"]
        name = {"Set30": "set 30 typed values (new bag)", "Get30": "get 30 typed values",
                "Enumerate30": "enumerate 30 tags"}[operation]
        row(f"Property bag: {name}", duration(own), f"std::map of variants {duration(floor)}",
            f"{own / floor:.2f}×", "–", "–")

    for call, item in (("GetPropertiesOfItem", "system"), ("GetPropertiesOfItem", "eth0"),
                       ("ValidatePropertyChanges", "system"), ("ValidatePropertyChanges", "eth0")):
        own = times[f"Plugin_{call}/{item}/double"]
        simulated = times[f"Plugin_{call}/{item}/simulated"]
        is_target = call == "GetPropertiesOfItem" and item == "system"
        row(f"Plug-in `{call}` {item}, library double (own cost)", duration(own),
            f"with the simulated library {duration(simulated)}", "–",
            "< 20 µs" if is_target else "–", verdict(own < 20000) if is_target else "–")

    own = times["Trace_DisabledBit"]
    row("Trace call, bit off", duration(own), "–", "–", "< 5 ns", verdict(own < 5))
    spdlog = times["Spdlog_LineToFile"]
    fprintf = times["Fprintf_LineToFile"]
    comparison = (f"spdlog {duration(spdlog)} ({1e9 / spdlog / 1e3:.0f}k lines/s); "
                  f"fprintf+fflush {duration(fprintf)}")
    per_line = times["Trace_RecordToFile"] / 2
    row("Trace record to the log file (text + thread/time line), per line", duration(per_line)
        + f" ({1e9 / per_line / 1e3:.0f}k lines/s)", comparison,
        f"{per_line / spdlog:.2f}× spdlog", "≤ 2× spdlog", verdict(per_line <= 2 * spdlog))
    single = times["Trace_LineToFile"]
    row("Single trace line to the log file", duration(single)
        + f" ({1e9 / single / 1e3:.0f}k lines/s)", comparison, f"{single / spdlog:.2f}× spdlog",
        "–", "–")

    row("Stripped plug-in, x86-64", f"{footprint['x86_64'] / 1024:.0f} KiB", "–", "–", "–", "–")
    if footprint.get("armhf") is None:
        row("Stripped plug-in, armhf", "armhf build not present", "–", "–", "≤ 512 KiB",
            "not measured")
    else:
        size = footprint["armhf"]
        row("Stripped plug-in, armhf", f"{size / 1024:.0f} KiB", "–", "–", "≤ 512 KiB",
            verdict(size <= 512 * 1024))
    added = memory["after_initialize_kib"] - memory["before_kib"]
    row("Resident memory added by load + `Initialize`", f"{added} KiB",
        f"{memory['anonymous_added_by_initialize_kib']} KiB of it anonymous (heap, data); "
        f"host before load {memory['before_kib']} KiB; after both items' properties "
        f"+{memory['after_properties_kib'] - memory['before_kib']} KiB", "–", "< 1024 KiB",
        verdict(added < 1024))

    header = ("Measure", "KEST (median)", "Comparison (median, same run)", "Ratio", "Target",
              "Met")
    print("| " + " | ".join(header) + " |")
    print("|" + "|".join("---" for _ in header) + "|")
    for measure in rows:
        print("| " + " | ".join(measure) + " |")


if __name__ == "__main__":
    main()
