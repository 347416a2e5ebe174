#!/usr/bin/env python3
"""Turns the JSON output of the benchmark executables into the suite's
report: one merged JSON file, a Markdown table of medians and ratios to the
peers with the targets, a scaling table, and the data and script of the
chart that gnuplot draws.

Benchmarks are named "<group>/<impl>/<size>"; Tessaline's implementation is
"tessaline", every other implementation of the same group and size is a peer.

usage: report.py [--quick] <out-dir> <machine-description> <json>...
"""
import json
import os
import sys

# (section, measure, Tessaline's benchmark, [(peer benchmark, largest ratio)])
# A peer may carry a third element, the number of its items per item of
# Tessaline's benchmark, where the two compare time per item at two sizes.
TARGETS = [
    ("Configuration", "load 1000x100 keys (2.2 MB)", "config_load/tessaline/1000x100",
     [("config_load/gkeyfile/1000x100", 0.8)]),
    ("Configuration", "look up every key once, other letter case (1000x100)",
     "config_lookup/tessaline/1000x100",
     [("config_lookup/gkeyfile/1000x100", 1.0), ("config_lookup/simpleini/1000x100", 0.5)]),
    ("Configuration", "change 1% and Flush 1000x100 (fsync)", "config_flush/tessaline/1000x100",
     [("config_flush/gkeyfile/1000x100", 1.0)]),
    ("Configuration", "load 10x10", "config_load/tessaline/10x10",
     [("config_load/simpleini/10x10", 1.0)]),
    ("Configuration", "lookup time per key, 1000x100 against 10x10", "config_lookup/tessaline/1000x100",
     [("config_lookup/tessaline/10x10", 1.3, 1000)]),
    ("Configuration", "lookup time per key, 10000x100 (1M keys) against 10x10", "config_lookup/tessaline/10000x100",
     [("config_lookup/tessaline/10x10", 1.3, 10000)]),
    ("Configuration", "load 40,000 keys whose names collide in the name hash, against 40,000 ordinary keys",
     "config_names/tessaline/colliding40000", [("config_names/tessaline/ordinary40000", 3.0)]),
    ("Configuration", "resident memory after loading 1000x100", "config_memory/tessaline/1000x100",
     [("config_memory/gkeyfile/1000x100", 1.0)]),
    ("Tool", "get, 10-line file, whole process", "tool_get/tessaline/1x8", [("tool_get/crudini/1x8", 0.1)]),
    ("Tool", "get, 1000x100, whole process", "tool_get/tessaline/1000x100",
     [("tool_get/crudini/1000x100", 0.1)]),
    ("Tool", "set, 10-line file, whole process", "tool_set/tessaline/1x8", [("tool_set/crudini/1x8", 0.1)]),
    ("Tool", "set, 1000x100, whole process", "tool_set/tessaline/1000x100",
     [("tool_set/crudini/1000x100", 0.1)]),
    ("Tool", "get, 10x10", "tool_get/tessaline/10x10", [("tool_get/crudini/10x10", 1.0)]),
    ("Tool", "set, 10x10", "tool_set/tessaline/10x10", [("tool_set/crudini/10x10", 1.0)]),
    ("Tool", "get, 100x100", "tool_get/tessaline/100x100", [("tool_get/crudini/100x100", 1.0)]),
    ("Tool", "set, 100x100", "tool_set/tessaline/100x100", [("tool_set/crudini/100x100", 1.0)]),
    ("Crypt", "blockEncrypt ECB, 128-bit key, 16 MiB", "crypt_ecb_encrypt/tessaline/16MiB",
     [("crypt_ecb_encrypt/botan/16MiB", 0.85)]),
    ("Crypt", "reKey 128-bit", "crypt_key_setup/tessaline/128", [("crypt_key_setup/gcrypt/128", 1.2)]),
    ("Crypt", "reKey 256-bit", "crypt_key_setup/tessaline/256", [("crypt_key_setup/gcrypt/256", 1.2)]),
    ("Crypt", "rvEncrypt of 64 bytes", "crypt_text_encrypt/tessaline/64B",
     [("crypt_text_encrypt/gcrypt/64B", 0.6)]),
    ("Crypt", "rvDecrypt of the 64-byte text", "crypt_text_decrypt/tessaline/64B",
     [("crypt_text_decrypt/gcrypt/64B", 0.6)]),
    ("Threads", "MMutex recursive lock+unlock", "thread_mutex_recursive/tessaline/uncontended",
     [("thread_mutex_recursive/std_recursive_mutex/uncontended", 2.5)]),
    ("Threads", "MMutex plain lock+unlock", "thread_mutex_plain/tessaline/uncontended",
     [("thread_mutex_plain/std_mutex/uncontended", 1.3)]),
    ("Threads", "MCondVar ping-pong round trip", "thread_condvar_pingpong/tessaline/round_trip",
     [("thread_condvar_pingpong/std_condition_variable/round_trip", 1.2)]),
    ("Threads", "MThread create + Wait(-1)", "thread_create_join/tessaline/empty_routine",
     [("thread_create_join/std_thread/empty_routine", 1.3)]),
    ("Files", "rvCopyFile of one 256 MiB file", "files_copy_large/tessaline/256MiB",
     [("files_copy_large/std_fs/256MiB", 1.1), ("files_copy_large/cp/256MiB", 1.0)]),
    ("Files", "copy a tree of 10,000 files of 1 KiB", "files_tree_copy/tessaline/100x100",
     [("files_tree_copy/std_fs/100x100", 1.0)]),
    ("Files", "rvUnlink of that tree", "files_tree_remove/tessaline/100x100",
     [("files_tree_remove/std_fs/100x100", 1.05)]),
    ("Files", "walk 100,000 entries by pattern", "files_walk/tessaline/100000",
     [("files_walk/readdir_fnmatch/100000", 1.2)]),
]

# Measures without a target, shown for completeness.
EXTRA = [
    ("Crypt", "blockDecrypt ECB, 128-bit key, 16 MiB", "crypt_ecb_decrypt/tessaline/16MiB"),
    ("Threads", "MMutex checked lock+unlock", "thread_mutex_checked/tessaline/uncontended"),
    ("Threads", "MThread create + Wait(0), the timed wait",
     "thread_create_join/tessaline_timed_wait/empty_routine"),
]

# Groups measured at three sizes, smallest first: (group, [(size, items)], unit of an item)
SCALING = [
    ("config_load", [("10x10", 100), ("100x100", 10000), ("1000x100", 100000), ("10000x100", 1000000)], "key"),
    ("config_lookup", [("10x10", 100), ("100x100", 10000), ("1000x100", 100000), ("10000x100", 1000000)], "key"),
    ("files_walk", [("1000", 1000), ("10000", 10000), ("100000", 100000)], "entry"),
    ("files_tree_copy", [("10x10", 100), ("10x100", 1000), ("100x100", 10000)], "file"),
]

UNIT_NS = {"ns": 1.0, "us": 1e3, "ms": 1e6, "s": 1e9}


def load_medians(paths, quick):
    """Median time in ns of every benchmark, by its three-part name."""
    medians = {}
    runs = []
    for path in paths:
        with open(path) as f:
            data = json.load(f)
        for run in data.get("benchmarks", []):
            runs.append(run)
            if run.get("error_occurred"):
                continue
            if quick:
                if run.get("run_type") != "iteration":
                    continue
            elif run.get("aggregate_name") != "median":
                continue
            name = run["run_name"]
            key = "/".join(name.split("/")[:3])
            if "resident_bytes" in run:
                medians[key] = run["resident_bytes"]
                continue
            field = "real_time" if "/real_time" in name else "cpu_time"
            medians[key] = run[field] * UNIT_NS[run.get("time_unit", "ns")]
    return medians, runs


# Groups whose figure is a number of bytes, not a time.
BYTE_GROUPS = {"config_memory"}


def human(ns, key=""):
    if ns is None:
        return "n/a"
    if key.split("/")[0] in BYTE_GROUPS:
        return f"{ns / 1e6:.3g} MB"
    for unit, scale in (("s", 1e9), ("ms", 1e6), ("µs", 1e3)):
        if ns >= scale:
            return f"{ns / scale:.3g} {unit}"
    return f"{ns:.3g} ns"


def impl_of(key):
    return key.split("/")[1]


def peer_label(key):
    """The peer's implementation, or its size where Tessaline is its own peer."""
    impl = impl_of(key)
    return key.split("/")[2] if impl == "tessaline" else impl


def best_peer(medians, key):
    group, _, size = key.split("/")
    peers = [(t, k) for k, t in medians.items()
             if k.split("/")[0] == group and k.split("/")[2] == size and not impl_of(k).startswith("tessaline")]
    return min(peers) if peers else (None, None)


def build_rows(medians, quick):
    rows = []
    for section, measure, ours, targets in TARGETS:
        mine = medians.get(ours)
        best_time, best_key = best_peer(medians, ours)
        checks, met = [], True
        for peer, limit, *per_item in targets:
            theirs = medians.get(peer)
            if mine is None or theirs is None:
                checks.append(f"n/a × {peer_label(peer)}")
                met = False
                continue
            ratio = mine / (theirs * (per_item[0] if per_item else 1))
            checks.append(f"{ratio:.2f} × {peer_label(peer)}")
            met = met and ratio <= limit
        rows.append({
            "section": section,
            "measure": measure,
            "key": ours,
            "tessaline": mine,
            "best_peer": impl_of(best_key) if best_key else None,
            "best_time": best_time,
            "ratio_best": mine / best_time if mine and best_time else None,
            "target": "; ".join(f"≤ {limit} × {peer_label(peer)}" for peer, limit, *_ in targets),
            "measured": "; ".join(checks),
            "met": None if quick else met,
        })
    return rows


def markdown(rows, medians, machine, quick):
    out = []
    if quick:
        out.append("Quick run (one short repetition): the figures are a smoke test and are not judged.\n")
    out.append(machine + "\n")
    out.append("| Group | Measure | Tessaline | Best peer | Ratio to best | Target | Measured | Met? |")
    out.append("|---|---|---|---|---|---|---|---|")
    for r in rows:
        best = f"{r['best_peer']} {human(r['best_time'], r['key'])}" if r["best_peer"] else "n/a"
        ratio = f"{r['ratio_best']:.2f}" if r["ratio_best"] else "n/a"
        met = "–" if r["met"] is None else ("yes" if r["met"] else "**no**")
        out.append(f"| {r['section']} | {r['measure']} | {human(r['tessaline'], r['key'])} | {best} | {ratio} | "
                   f"{r['target']} | {r['measured']} | {met} |")
    out.append("")
    out.append("Other measures (no target):\n")
    out.append("| Group | Measure | Tessaline | Best peer | Ratio to best |")
    out.append("|---|---|---|---|---|")
    for section, measure, ours in EXTRA:
        mine = medians.get(ours)
        best_time, best_key = best_peer(medians, ours)
        ratio = f"{mine / best_time:.2f}" if mine and best_time else "n/a"
        best = f"{impl_of(best_key)} {human(best_time)}" if best_key else "n/a"
        out.append(f"| {section} | {measure} | {human(mine)} | {best} | {ratio} |")
    out.append("")
    out.append("Scaling: time per item at each size, and the growth of the total from one size to the next "
               "against the growth of the input (1.0 = linear).\n")
    columns = max(len(sizes) for _, sizes, _ in SCALING)
    out.append("| Group | Implementation | " + " | ".join(f"Size {n + 1}" for n in range(columns)) + " | Growth |")
    out.append("|---|---|" + "---|" * columns + "---|")
    for group, sizes, unit in SCALING:
        impls = sorted({impl_of(k) for k in medians if k.startswith(group + "/")},
                       key=lambda i: (not i.startswith("tessaline"), i))
        for impl in impls:
            cells, growth = [], []
            previous = None
            for size, items in sizes:
                t = medians.get(f"{group}/{impl}/{size}")
                cells.append(f"{size}: {human(t / items)}/{unit}" if t else f"{size}: n/a")
                if t and previous:
                    growth.append(f"{(t / previous[0]) / (items / previous[1]):.2f}")
                previous = (t, items) if t else None
            cells += [""] * (columns - len(cells))
            out.append(f"| {group} | {impl} | " + " | ".join(cells) + f" | {', '.join(growth) or 'n/a'} |")
    out.append("")
    return "\n".join(out)


def chart_files(rows, out_dir, stem):
    data_path = os.path.join(out_dir, stem + ".dat")
    with open(data_path, "w") as f:
        for r in rows:
            if r["ratio_best"]:
                label = f"{r['section']}: {r['measure']}".replace('"', "'")
                f.write(f"\"{label}\" {r['ratio_best']:.4f}\n")
    script_path = os.path.join(out_dir, stem + ".gp")
    with open(script_path, "w") as f:
        f.write(f"""set terminal pngcairo size 1400,800 font 'Sans,10'
set output '{os.path.join(out_dir, stem + '.png')}'
set title "Tessaline time relative to the best peer (below 1 is faster)"
set style fill solid 0.8 border -1
set boxwidth 0.7
set yrange [0:*]
set grid ytics
set xtics rotate by -40 left
set bmargin 14
set rmargin 18
set arrow from graph 0, first 1 to graph 1, first 1 nohead lw 2 lc rgb '#cc0000'
set key off
plot '{data_path}' using 0:2:xtic(1) with boxes lc rgb '#3070b0', \\
     '' using 0:2:(sprintf('%.2f', $2)) with labels offset 0,0.7
""")
    return script_path


def main():
    args = sys.argv[1:]
    quick = args[0] == "--quick"
    if quick:
        args = args[1:]
    out_dir, machine, paths = args[0], args[1], args[2:]
    medians, runs = load_medians(paths, quick)
    rows = build_rows(medians, quick)
    stem = "latest"
    with open(os.path.join(out_dir, stem + ".json"), "w") as f:
        json.dump({"machine": machine, "quick": quick, "medians_ns": medians, "targets": rows,
                   "benchmarks": runs}, f, indent=1, ensure_ascii=False)
    with open(os.path.join(out_dir, stem + ".md"), "w") as f:
        f.write(markdown(rows, medians, machine, quick))
    print(chart_files(rows, out_dir, stem))


if __name__ == "__main__":
    main()
