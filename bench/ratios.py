#!/usr/bin/env python3
"""Prints tables from the medians of one run of json_bench (Google Benchmark's JSON output):
two for each class of documents, and one of jsonvalue against itself. The first gives, for each document and operation, jsonvalue's throughput and the
ratio of its throughput to each peer's (above 1.0: jsonvalue is faster). The second gives, for
each operation and peer, the geometric mean of that ratio over the documents and the worst
document's ratio. For memory, the ratio is the peer's heap divided by jsonvalue's (above 1.0:
jsonvalue holds less). A peer without the operation shows "-". The third compares jsonvalue's
operations with each other: the common two-space layout against its own pretty text, the
event writer against serialize, and the parse with exact numbers against the default parse."""
import json
import math
import sys

PEERS = [("nlohmann", "nlohmann"), ("jsoncpp", "jsoncpp"), ("rapidjson", "RapidJSON"),
         ("boostjson", "Boost.JSON"), ("simdjson", "simdjson")]
OPERATIONS = ["compact", "pretty", "events", "parse", "validate", "copy", "destroy", "memory"]
# jsonvalue against itself: (operation, the operation it is measured against).
OWN_RATIOS = [("common", "pretty"), ("events", "compact"), ("exact", "parse")]
# The classes of documents, each with its own tables.
CLASSES = [("large documents", ["twitter", "citm_catalog", "canada"]),
           ("small documents", ["rpc_call", "log_event", "geo_feature", "api_page", "package"]),
           ("number-heavy documents", ["geojson_tracks", "mesh"])]
DOCUMENTS = CLASSES[0][1]
# Documents measured by jsonvalue alone (canada.json as jsonvalue writes it).
OWN_DOCUMENTS = DOCUMENTS + ["canada_written"]


def medians(report):
    """The median of each benchmark: bytes per second, heap bytes for memory/, and the time of
    the patch benchmarks (OPERATION/LIBRARY/DOCUMENT), which have no throughput."""
    values = {}
    for run in report["benchmarks"]:
        name = run["run_name"].split("/iterations")[0]
        if run.get("aggregate_name", "median") != "median":
            continue
        if name.startswith("memory/"):
            values[name] = run["heap_bytes"]
        elif "bytes_per_second" in run:
            values[name] = run["bytes_per_second"]
        else:
            values[name] = run["real_time"]
    return values


# The patch benchmarks: jsonvalue's operation, and nlohmann's that do the same job.
PATCHES = [("patch", "canada", ["patch", "patch_inplace"]), ("diff", "citm_catalog", ["diff"])]


def print_patches(values):
    print("### patches (nlohmann's time over jsonvalue's)")
    print()
    print("| operation | document | nlohmann's operation | ratio |")
    print("|---|---|---|---|")
    for operation, document, theirs in PATCHES:
        ours = values.get(f"{operation}/jsonvalue/{document}")
        for peer_operation in theirs:
            peer = values.get(f"{peer_operation}/nlohmann/{document}")
            if ours is not None and peer is not None:
                print(f"| {operation} | {document} | {peer_operation} | {peer / ours:.2f} |")
    print()


def ratio(values, operation, document, peer):
    """jsonvalue against the peer, above 1.0 in jsonvalue's favour; None if either is missing."""
    ours = values.get(f"{operation}/{document}/jsonvalue")
    theirs = values.get(f"{operation}/{document}/{peer}")
    # A heap too small for mallinfo to see (a small document reusing freed chunks) is no figure.
    if not ours or not theirs:
        return None
    return theirs / ours if operation == "memory" else ours / theirs


def print_class(values, title, documents):
    peer_columns = " | ".join("vs " + name for _, name in PEERS) + " |"
    print(f"### {title}")
    print()
    print("| document | operation | jsonvalue | " + peer_columns)
    print("|---|---|---|" + "---|" * len(PEERS))
    for document in documents:
        for operation in OPERATIONS:
            ours = values.get(f"{operation}/{document}/jsonvalue")
            if ours is None:
                continue
            cells = []
            for peer, _ in PEERS:
                value = ratio(values, operation, document, peer)
                cells.append("-" if value is None else f"{value:.2f}")
            shown = f"{ours / 1e6:.2f} MB" if operation == "memory" else f"{ours / 1e6:.0f} MB/s"
            print(f"| {document} | {operation} | {shown} | " + " | ".join(cells) + " |")

    print()
    print("| operation | " + peer_columns)
    print("|---|" + "---|" * len(PEERS))
    for operation in OPERATIONS:
        cells = []
        for peer, _ in PEERS:
            ratios = [ratio(values, operation, document, peer) for document in documents]
            ratios = [value for value in ratios if value is not None]
            if not ratios:
                cells.append("-")
                continue
            mean = math.exp(sum(math.log(value) for value in ratios) / len(ratios))
            cells.append(f"{mean:.2f} (worst {min(ratios):.2f})")
        print(f"| {operation} | " + " | ".join(cells) + " |")
    print()


def main():
    values = medians(json.load(open(sys.argv[1])))
    for title, documents in CLASSES:
        if any(f"parse/{document}/jsonvalue" in values for document in documents):
            print_class(values, title, documents)
    print_patches(values)
    print("### jsonvalue against itself")
    print()
    print("| document | " + " | ".join(f"{a} / {b}" for a, b in OWN_RATIOS) + " |")
    print("|---|" + "---|" * len(OWN_RATIOS))
    for document in OWN_DOCUMENTS:
        cells = []
        for operation, reference in OWN_RATIOS:
            ours = values.get(f"{operation}/{document}/jsonvalue")
            theirs = values.get(f"{reference}/{document}/jsonvalue")
            cells.append("-" if ours is None or theirs is None else f"{ours / theirs:.2f}")
        print(f"| {document} | " + " | ".join(cells) + " |")


if __name__ == "__main__":
    main()
