"""A hub made of canned documents, which misbehaves where a real one never would."""
import http.server
import json
import threading

BASE = "http://ns.meridane.example/zo/rel"
TOKEN = "login-token=fake-hub-token-0123456789"


def link(rel, href):
    return {"rel": rel if "/" not in rel else BASE + rel, "href": href}


class FakeHub:
    """Serves one production whose asset names, and whose answers, a test chooses.

    `statuses` maps a path to a status that is answered in place of a document; a path in `stalled` is never
    answered, and `stalled_reached` is set when such a request has come."""

    def __init__(self, names=("clip",), enclosures=("notes",)):
        self.names = names
        self.enclosures = enclosures
        self.statuses = {}
        self.stalled = set()
        self.stalled_reached = threading.Event()
        self.release = threading.Event()
        hub = self

        class Handler(http.server.BaseHTTPRequestHandler):
            protocol_version = "HTTP/1.1"

            def log_message(self, *_):
                pass

            def do_GET(self):
                hub.answer(self)

            def do_POST(self):
                self.rfile.read(int(self.headers.get("Content-Length", "0")))
                hub.answer(self)

        self.server = http.server.ThreadingHTTPServer(("127.0.0.1", 0), Handler)
        self.server.daemon_threads = True
        self.url = f"http://127.0.0.1:{self.server.server_address[1]}"
        self.thread = threading.Thread(target=self.server.serve_forever)
        self.thread.start()

    def close(self):
        self.release.set()
        self.server.shutdown()
        self.server.server_close()
        self.thread.join()

    def answer(self, request):
        path = request.path
        if path in self.stalled:
            self.stalled_reached.set()
            self.release.wait()
            request.close_connection = True
            return
        if path in self.statuses:
            self.send(request, self.statuses[path], b"{}")
            return
        if path == "/login":
            self.send(request, 200, b"{}", [("Set-Cookie", TOKEN + "; Path=/; HttpOnly")])
            return
        signed_in = TOKEN in request.headers.get("Cookie", "")
        document = self.document(path, signed_in)
        if isinstance(document, bytes):
            self.send(request, 200, document, content_type="application/octet-stream")
        elif document is None:
            self.send(request, 404, b"{}")
        else:
            self.send(request, 200, json.dumps(document).encode())

    @staticmethod
    def send(request, status, body, headers=(), content_type="application/json;charset=utf-8"):
        request.send_response(status)
        for name, value in headers:
            request.send_header(name, value)
        request.send_header("Content-Type", content_type)
        request.send_header("Content-Length", str(len(body)))
        request.end_headers()
        request.wfile.write(body)

    def document(self, path, signed_in):
        server = {"id": "fake", "name": "fake", "description": "", "version": "1.0.0"}
        if path == "/content/zo/api/discovery.json":
            return {"server": server, "links": [link("/discovery/v1", self.url + "/links")]}
        if path == "/links":
            links = [link("/system/login", self.url + "/login")]
            if signed_in:
                links = [link("/system/logout", self.url + "/logout"), link("/productions", self.url + "/p"),
                         link("/productions/production#byIdAndCommitId",
                              self.url + "/p/{productionId}/at/{commitId}")]
            return {"server": server, "properties": {"majorVersion": 1, "minorVersion": 2}, "links": links}
        if path == "/logout":
            return {}
        if path == "/p":
            return {"productions": [self.production()], "links": []}
        if path.startswith("/p/prod/at/"):
            return self.production()
        if path == "/assets":
            return {"assets": [self.asset(*numbered) for numbered in enumerate(self.names)], "links": []}
        if path == "/e":
            return {"enclosures": [], "links": []}
        if path.startswith("/payload/"):
            return b"payload of " + path.encode()
        return None

    def production(self):
        return {"zo:productionId": "prod", "zo:commitId": "c1", "properties": {"name": "Fake", "description": ""},
                "links": [link("self", self.url + "/p/prod/at/c1"), link("latest-version", self.url + "/p/prod/at/HEAD"),
                          link("/assets#full", self.url + "/assets"), link("/enclosures", self.url + "/e")]}

    def asset(self, number, name):
        enclosures = [{"name": enclosure, "zo:enclosureId": f"e{index}", "zo:enclosureContentId": f"h{number}.{index}",
                       "links": [link("/enclosures/enclosure", f"{self.url}/payload/{number}/{index}")]}
                      for index, enclosure in enumerate(self.enclosures)]
        return {"zo:assetId": f"asset{number}", "zo:assetContentId": f"s{number}",
                "properties": {"name": name, "description": "", "cdzo:assetType": "masterclip"},
                "links": [link("/enclosures", f"{self.url}/a/{number}/e"), link("/renditions", f"{self.url}/a/{number}/r")],
                "enclosures": {"enclosures": enclosures, "links": []},
                "renditions": {"renditions": [], "links": []}}
