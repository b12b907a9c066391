#!/usr/bin/env python3
"""A generic reader of RDF finds the same graph in a packet and in what the library makes of it."""
import pathlib
import re
import subprocess
import sys

import rdflib
import rdflib.compare

BASE = "urn:packet"


def graph_of(packet):
    """The graph of the rdf:RDF element alone; what stands around it is no RDF."""
    outer_language = re.search(rb"<x:xmpmeta[^>]*xml:lang=", packet)
    assert not outer_language, "a language outside of rdf:RDF would be lost to the generic reader"
    element = re.search(rb"<rdf:RDF\b.*</rdf:RDF>", packet, re.DOTALL).group(0)
    graph = rdflib.Graph()
    graph.parse(data=element, format="xml", publicID=BASE)
    return graph


def canonical(program, packet, *options):
    return subprocess.run([program, *options], input=packet, check=True, capture_output=True).stdout


def difference(before, after):
    only_before, only_after = rdflib.compare.graph_diff(before, after)[1:]
    return f"lost:\n{only_before.serialize()}\nnew:\n{only_after.serialize()}"


def main():
    program, seeds = sys.argv[1], pathlib.Path(sys.argv[2])
    failures = []
    packets = sorted(seeds.glob("graph-*"))
    assert len(packets) >= 5, f"too few packets in {seeds}"
    for path in packets:
        packet = path.read_bytes()
        before = graph_of(packet)
        assert len(before) > 1, f"{path.name} says nothing"
        for options in ([], ["--compact"]):
            after = graph_of(canonical(program, packet, *options))
            same = rdflib.compare.isomorphic(before, after)
            print(f"{path.name} {' '.join(options)}: {len(before)} triples, {'equal' if same else 'DIFFERENT'}")
            if not same:
                failures.append(f"{path.name} {options}\n{difference(before, after)}")
    # The comparison can fail: one word less is seen.
    changed = graph_of(packets[0].read_bytes().replace(b"1", b"", 1))
    if rdflib.compare.isomorphic(changed, graph_of(canonical(program, packets[0].read_bytes()))):
        failures.append("a changed packet was found equal")
    print("\n".join(failures))
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
