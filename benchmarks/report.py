"""Turns the output of gridmill_benchmarks into a table, and into a list of rows for other programs."""

import argparse
import json
import os
import sys

SPEEDS = ("gridmill", "naive", "vectorised", "opencv", "gdal", "numpy", "numba", "one_core", "roof")


def read_rows(path):
    """The rows of a run: job, types, size, speeds in Mpixel/s, ratios of gridmill to each; or a failure."""
    with open(path, encoding="utf-8") as file:
        benchmarks = json.load(file)["benchmarks"]
    rows = []
    for entry in benchmarks:
        job, types, size = entry["name"].split("/")[:3]
        row = {"job": job, "types": types, "size": size, "failure": entry.get("error_message")}
        row["speeds"] = {name: entry.get(name) for name in SPEEDS}
        row["ratios"] = {name: entry.get("vs " + name) for name in SPEEDS}
        rows.append(row)
    return rows


def speed(value):
    return "" if value is None else f"{value:.0f}" if value >= 100 else f"{value:.1f}"


def ratio(value):
    return "" if value is None else f"{value:.1f} x" if value >= 10 else f"{value:.2f} x"


def share(value):
    return "" if value is None else f"{100 * value:.0f} %"


def cells(row):
    speeds, ratios = row["speeds"], row["ratios"]
    return (
        [row["job"], row["types"], row["size"], speed(speeds["gridmill"])]
        + [text for name in SPEEDS[1:-1] for text in (speed(speeds[name]), ratio(ratios[name]))]
        + [speed(speeds["roof"]), share(ratios["roof"])]
    )


def print_table(rows):
    others = [text for name in SPEEDS[1:-1] for text in (name.replace("one_", "1 "), "")]
    titles = ["job", "types", "size", "gridmill", *others, "roof", "share"]
    table = [titles] + [cells(row) for row in rows if row["failure"] is None]
    shown = [i for i in range(len(titles)) if any(line[i] for line in table[1:])]
    widths = {i: max(len(line[i]) for line in table) for i in shown}
    for line in table:
        padded = (line[i].ljust(widths[i]) if i < 3 else line[i].rjust(widths[i]) for i in shown)
        print("  ".join(padded).rstrip())


def write_json(rows, path):
    """Writes beside the file and renames: the file is whole or untouched."""
    plain = [
        {"job": row["job"], "types": row["types"], "size": row["size"]} | row["speeds"]
        for row in rows
        if row["failure"] is None
    ]
    beside = path + ".new"
    with open(beside, "w", encoding="utf-8") as file:
        json.dump(plain, file, indent=2)
        file.write("\n")
    os.replace(beside, path)


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("results", help="the file that --benchmark_out wrote")
    parser.add_argument("--json", metavar="FILE", help="write the rows to FILE as well")
    arguments = parser.parse_args()

    rows = read_rows(arguments.results)
    print("Mpixel/s; after each other contestant, how many times faster gridmill is. roof: a plain copy of")
    print("as many bytes as the job reads and writes.")
    print()
    print_table(rows)
    failures = [row for row in rows if row["failure"] is not None]
    for row in failures:
        print(f"FAILED: {row['job']}, {row['types']}, {row['size']}: {row['failure']}", file=sys.stderr)
    if failures:
        return 1
    if arguments.json:
        write_json(rows, arguments.json)
    return 0


if __name__ == "__main__":
    sys.exit(main())
