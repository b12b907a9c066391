"""The way to the hub leads through a proxy when one is set, for every request and in the order of the settings."""
import select
import socket
import threading
import unittest
import urllib.parse

from harness import MEDIA, NETWORK, OK, PATIENCE, USAGE, EndToEndTest, closed_port

FAR_HUB = "hub.example"
"""A name that only the proxy can reach."""


class Proxy:
    """A forward proxy: requests with an absolute URL, and tunnels. It notes the host and port of each."""

    def __init__(self, far_port):
        self.far_port = far_port
        self.seen = []
        self.listener = socket.create_server(("127.0.0.1", 0))
        self.url = f"http://127.0.0.1:{self.listener.getsockname()[1]}"
        threading.Thread(target=self.accept, daemon=True).start()

    def close(self):
        self.listener.close()

    def accept(self):
        while True:
            try:
                connection, _ = self.listener.accept()
            except OSError:
                return
            threading.Thread(target=self.serve, args=(connection,), daemon=True).start()

    def reach(self, host, port):
        return socket.create_connection(("127.0.0.1", self.far_port if host == FAR_HUB else port), PATIENCE)

    def serve(self, connection):
        with connection:
            head = b""
            while b"\r\n\r\n" not in head:
                received = connection.recv(65536)
                if not received:
                    return
                head += received
            line, rest = head.split(b"\r\n", 1)
            method, target, version = line.decode("ascii").split(" ")
            if method == "CONNECT":
                host, port = target.rsplit(":", 1)
                self.seen.append(("CONNECT", host))
                far = self.reach(host, int(port))
                connection.sendall(b"HTTP/1.1 200 tunnel\r\n\r\n")
            else:
                url = urllib.parse.urlsplit(target)
                self.seen.append((method, url.hostname))
                far = self.reach(url.hostname, url.port)
                path = target.split("/", 3)[3]
                # One request a connection: the next one is read as a new request, not passed on unseen.
                rest = rest.replace(b"\r\n", b"\r\nConnection: close\r\n", 1)
                far.sendall(f"{method} /{path} {version}\r\n".encode("ascii") + rest)
            with far:
                self.pass_on(connection, far)

    @staticmethod
    def pass_on(one, other):
        while True:
            ready, _, _ = select.select([one, other], [], [], PATIENCE)
            if not ready:
                return
            for source in ready:
                received = source.recv(65536)
                if not received:
                    return
                (other if source is one else one).sendall(received)


class ThroughAProxy(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.server = self.hub()
        self.server.add_user("ada", "secret")
        self.server.import_folder(MEDIA, "Harbour Film", "ada")
        self.server.start()
        port = urllib.parse.urlsplit(self.server.url).port
        self.far_url = f"http://{FAR_HUB}:{port}"
        self.proxy = self.new_proxy(port)
        self.other = self.new_proxy(port)
        self.ada = self.user()

    def new_proxy(self, port):
        proxy = Proxy(port)
        self.addCleanup(proxy.close)
        return proxy

    def login(self, url, *extra, user=None, **variables):
        user = user or self.ada
        return user.zo("login", "--server", url, "--user", "ada", "--password-file", user.password_file("secret"),
                       *extra, **variables)

    def taken(self, proxy):
        seen, proxy.seen = proxy.seen, []
        return seen

    def test_every_request_of_a_plain_hub_goes_through_it(self):
        self.ends(self.login(self.far_url, "--plain", "--proxy", self.proxy.url), OK)
        methods = {method for method, host in self.taken(self.proxy) if host == FAR_HUB}
        self.assertEqual(methods, {"GET", "POST"})
        for words in (["productions"], ["open", "Harbour Film"], ["assets"], ["get", "gulls.jpg", "-o", "got/"]):
            self.ends(self.ada.zo(*words, "--proxy", self.proxy.url), OK)
            self.assertTrue(self.taken(self.proxy), words)
        self.assertEqual((self.ada.home / "got" / "gulls.jpg").read_bytes(),
                         (MEDIA / "broll" / "gulls.jpg").read_bytes())
        # Without it the name means nothing.
        self.ends(self.ada.zo("productions"), NETWORK)

    def test_an_encrypted_hub_is_reached_by_a_tunnel(self):
        self.ends(self.login(self.server.tls_url, "--ca", self.server.ca_file, https_proxy=self.proxy.url), OK)
        self.assertEqual({method for method, _ in self.taken(self.proxy)}, {"CONNECT"})

    def test_flag_environment_configuration(self):
        def used(*extra, **variables):
            self.ends(self.ada.zo("productions", *extra, **variables), OK)
            return [name for name, proxy in (("proxy", self.proxy), ("other", self.other)) if self.taken(proxy)]

        self.ends(self.login(self.server.url), OK)
        self.assertEqual(used(), [])
        (self.ada.home / "config" / "zo.conf").write_text(f"proxy = {self.proxy.url}\n")
        self.assertEqual(used(), ["proxy"])
        self.assertEqual(used(http_proxy=self.other.url), ["other"])
        self.assertEqual(used(http_proxy=self.proxy.url, ZOCLIENT_PROXY=self.other.url), ["other"])
        self.assertEqual(used("--proxy", self.proxy.url, ZOCLIENT_PROXY=self.other.url), ["proxy"])
        self.assertEqual(used(http_proxy=self.other.url, NO_PROXY="127.0.0.1"), [])
        (self.ada.home / "config" / "zo.conf").write_text(
            f"proxy = {self.proxy.url}\nno-proxy = 127.0.0.1\n")
        self.assertEqual(used(), [])

    def test_a_proxy_that_is_not_there_and_none_at_all(self):
        keeper, port = closed_port()
        self.addCleanup(keeper.close)
        refused = self.ends(self.login(self.server.url, "--proxy", f"http://127.0.0.1:{port}"), NETWORK)
        self.assertIn("could not be reached", refused.error_text)
        self.ends(self.login(self.server.url, "--proxy", ""), USAGE)


if __name__ == "__main__":
    unittest.main()
