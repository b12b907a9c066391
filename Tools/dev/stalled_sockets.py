#!/usr/bin/env python3
"""Measures what stalled connections do to the hub's other clients.

  stalled_sockets.py BUILD_DIR [--sockets 1000] [--requests 3000] [--deadline-ms 5000]

Starts a zohub of its own, opens connections that stop in the middle of a head, of a body, or before a first
byte, and asks for the discovery document over and over on kept connections, before and with them. Prints both
latencies and says whether the 99th percentile stays under 100 ms and whether all stalled ones were cut.
"""
import argparse
import http.client
import json
import pathlib
import select
import socket
import subprocess
import sys
import tempfile
import time

DISCOVERY = "/content/zo/api/discovery.json"
BEGINNINGS = (
    b"GET " + DISCOVERY.encode() + b" HTTP/1.1\r\nHost: 127.0.0.1\r\nX-Slow: ",
    b"POST /zo/1/system/login HTTP/1.1\r\nHost: 127.0.0.1\r\nContent-Length: 4000\r\n"
    b"Content-Type: application/x-www-form-urlencoded\r\n\r\nj_user",
    b"",
)
LIMIT_MS = 100.0


def latencies(port, count):
    found = []
    connections = [http.client.HTTPConnection("127.0.0.1", port, timeout=30) for _ in range(4)]
    for number in range(count):
        connection = connections[number % len(connections)]
        before = time.perf_counter()
        connection.request("GET", DISCOVERY)
        answer = connection.getresponse()
        answer.read()
        found.append((time.perf_counter() - before) * 1000)
        if answer.status != 200:
            raise RuntimeError(f"the discovery document came with status {answer.status}")
    for connection in connections:
        connection.close()
    return sorted(found)


def percentile(sorted_values, part):
    return sorted_values[min(len(sorted_values) - 1, int(len(sorted_values) * part))]


def report(what, values):
    print(f"{what}: median {percentile(values, 0.5):.2f} ms, 99th {percentile(values, 0.99):.2f} ms, "
          f"worst {values[-1]:.2f} ms")


def wait_until_cut(sockets, seconds):
    """The number of connections that the hub has closed by then."""
    poller = select.poll()
    for one in sockets:
        poller.register(one, select.POLLIN | select.POLLHUP)
    by_number = {one.fileno(): one for one in sockets}
    end = time.monotonic() + seconds
    cut = 0
    while by_number and time.monotonic() < end:
        for number, _ in poller.poll(200):
            try:
                if by_number[number].recv(4096):
                    continue
            except OSError:
                pass
            poller.unregister(number)
            del by_number[number]
            cut += 1
    return cut


def main() -> int:
    parser = argparse.ArgumentParser()
    parser.add_argument("build", type=pathlib.Path)
    parser.add_argument("--sockets", type=int, default=1000)
    parser.add_argument("--requests", type=int, default=3000)
    parser.add_argument("--deadline-ms", type=int, default=5000)
    asked = parser.parse_args()
    with tempfile.TemporaryDirectory() as folder:
        ready = pathlib.Path(folder, "ready")
        hub = subprocess.Popen(
            [asked.build / "bin" / "zohub", "serve", "--data", folder, "--port", "0", "--no-tls", "--ready-file",
             ready, "--header-timeout-ms", str(asked.deadline_ms), "--body-timeout-ms", str(asked.deadline_ms)],
            stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        try:
            end = time.monotonic() + 30
            while not ready.exists() or not ready.read_text().strip():
                if hub.poll() is not None or time.monotonic() > end:
                    raise RuntimeError("the hub did not start")
                time.sleep(0.02)
            port = int(json.loads(ready.read_text())["httpUrl"].rsplit(":", 1)[1])
            report("alone", latencies(port, asked.requests))
            stalled = []
            for number in range(asked.sockets):
                one = socket.create_connection(("127.0.0.1", port), timeout=30)
                one.sendall(BEGINNINGS[number % len(BEGINNINGS)])
                stalled.append(one)
            among = latencies(port, asked.requests)
            report(f"with {asked.sockets} stalled connections", among)
            expected = sum(1 for number in range(asked.sockets) if BEGINNINGS[number % len(BEGINNINGS)])
            cut = wait_until_cut(stalled, asked.deadline_ms / 1000 * 3)
            good = percentile(among, 0.99) < LIMIT_MS and cut >= expected
            print(f"cut at the deadline: {cut} of the {expected} that had begun a request; "
                  f"{'holds' if good else 'falls short'}")
            return 0 if good else 1
        finally:
            hub.terminate()
            hub.wait(timeout=20)


if __name__ == "__main__":
    sys.exit(main())
