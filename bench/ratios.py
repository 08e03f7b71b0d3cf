#!/usr/bin/env python3
"""Prints the benchmark table: for each document and operation, jsonvalue's throughput and
the ratio of its throughput to each peer's (above 1.0: jsonvalue is faster), from the medians
of one run of json_bench (Google Benchmark's JSON output). For memory, the ratio is the
peer's heap divided by jsonvalue's (above 1.0: jsonvalue holds less)."""
import json
import sys

PEERS = [("rapidjson", "RapidJSON"), ("boostjson", "Boost.JSON"), ("nlohmann", "nlohmann")]
OPERATIONS = ["compact", "pretty", "parse", "copy", "destroy", "memory"]
DOCUMENTS = ["twitter", "citm_catalog", "canada"]


def medians(report):
    values = {}
    for run in report["benchmarks"]:
        name = run["run_name"].split("/iterations")[0]
        if run.get("aggregate_name", "median") != "median":
            continue
        if name.startswith("memory/"):
            values[name] = run["heap_bytes"]
        else:
            values[name] = run["bytes_per_second"]
    return values


def main():
    values = medians(json.load(open(sys.argv[1])))
    print("| document | operation | jsonvalue | " + " | ".join("vs " + title for _, title in PEERS) + " |")
    print("|---|---|---|" + "---|" * len(PEERS))
    for document in DOCUMENTS:
        for operation in OPERATIONS:
            ours = values.get(f"{operation}/{document}/jsonvalue")
            if ours is None:
                continue
            cells = []
            for peer, _ in PEERS:
                theirs = values.get(f"{operation}/{document}/{peer}")
                if theirs is None:
                    cells.append("-")
                elif operation == "memory":
                    cells.append(f"{theirs / ours:.2f}")
                else:
                    cells.append(f"{ours / theirs:.2f}")
            shown = f"{ours / 1e6:.2f} MB" if operation == "memory" else f"{ours / 1e6:.0f} MB/s"
            print(f"| {document} | {operation} | {shown} | " + " | ".join(cells) + " |")


if __name__ == "__main__":
    main()
