"""The interface by curl: what it answers, and each way to be refused."""

import json
import os
import socket
import subprocess
import unittest

from serving import PATIENCE, ServerTest, curl

MESSAGES = "/velkor/configuration/"
TOKENS = "# who may come\nread reader\nwrite writer\n"


def patch(*changes):
    return ["-X", "PATCH", "-d", json.dumps({"changes": list(changes)})]


def number(value):
    return {"type": "int", "value": value}


class AnswersTest(ServerTest):
    def setUp(self):
        super().setUp()
        self.server = self.serve(self.file("app.properties", "host = here\nport = 80\n"),
                                 "--allow-writes", "--property-root", self.folder)

    def ask(self, path, *arguments):
        return curl(self.server.url + path, *arguments)

    def test_messages_are_answered_with_their_type(self):
        answer = self.ask(MESSAGES + "ConfigurationGet", "-d", '{"key":"host"}')
        self.assertEqual(answer.status, 200)
        self.assertEqual(answer.headers["message-type"],
                         "velkor/configuration/ConfigurationOptionResponse")
        self.assertEqual(answer.json, {"key": "host", "source": "app",
                                       "value": {"type": "string", "value": "here"}})

    def test_an_acknowledgement_has_no_content(self):
        self.file("more.properties", "more = 1\n")
        answer = self.ask(MESSAGES + "AddPropertyFileSource", "-d",
                          '{"name":"more","order":900,"path":"more.properties"}')
        self.assertEqual((answer.status, answer.body), (204, ""))
        self.assertEqual(self.ask("/config/more").json["layers"][0]["source"], "more")

    def test_a_write_is_read_by_everybody(self):
        self.ask(MESSAGES + "ConfigurationSet", "-d", '{"key":"port","value":{"type":"int","value":1}}')
        self.assertEqual(self.ask("/config/port").json["layers"][0],
                         {"source": "override", "value": number(1)})

    def test_several_changes_are_made_together(self):
        answer = self.ask("/config", *patch({"key": "a", "value": number(1)},
                                            {"key": "b", "value": number(2)}))
        self.assertEqual(answer.json, {"dryRun": False,
                                       "changes": [{"key": "a", "source": "override"},
                                                   {"key": "b", "source": "override"}]})
        self.assertEqual([item["key"] for item in self.ask("/config").json["items"]],
                         ["a", "b", "host", "port"])

    def test_a_dry_run_changes_nothing(self):
        answer = self.ask("/config?dry-run", *patch({"key": "a", "value": number(1)}))
        self.assertTrue(answer.json["dryRun"])
        self.assertEqual(self.ask("/config/a").status, 404)

    def test_the_options_come_in_pages(self):
        first = self.ask("/config?limit=1").json
        second = self.ask("/config?limit=1&cursor=" + first["next"]).json
        self.assertEqual([first["items"][0]["key"], second["items"][0]["key"]], ["host", "port"])
        self.assertNotIn("next", second)

    def test_any_key_has_a_path(self):
        self.ask(MESSAGES + "ConfigurationSet", "-d",
                 '{"key":"a/b c?%","value":{"type":"int","value":1}}')
        self.assertEqual(self.ask("/config/a%2Fb%20c%3F%25").json["key"], "a/b c?%")

    def test_a_watch_tells_one_event_after_the_other(self):
        watch = subprocess.Popen(["curl", "--silent", "--no-buffer", "--max-time", str(PATIENCE),
                                  self.server.url + "/watch?key=port"],
                                 stdout=subprocess.PIPE, text=True)
        self.addCleanup(watch.stdout.close)
        self.addCleanup(watch.wait)
        self.addCleanup(watch.kill)
        first = [watch.stdout.readline() for _ in range(3)]
        self.ask("/config", *patch({"key": "port", "value": number(1)}))
        second = [watch.stdout.readline() for _ in range(3)]
        self.assertEqual(first, ["id: 1\n", 'data: {"type":"string","value":"80"}\n', "\n"])
        self.assertEqual(second, ["id: 2\n", 'data: {"type":"int","value":1}\n', "\n"])

    def test_health_is_told_in_plain_words(self):
        self.assertEqual(self.ask("/healthz").body, "alive\n")
        self.assertEqual(self.ask("/readyz").body, "ready\n")

    def test_the_page_needs_nothing_from_elsewhere(self):
        answer = self.ask("/")
        self.assertEqual(answer.headers["content-type"], "text/html; charset=utf-8")
        self.assertIn("default-src 'none'", answer.headers["content-security-policy"])

    def test_the_metrics_are_those_of_prometheus(self):
        answer = self.ask("/metrics")
        self.assertEqual(answer.headers["content-type"],
                         "text/plain; version=0.0.4; charset=utf-8")
        self.assertIn("\nvelkor_keys 2\n", answer.body)

    def test_the_head_of_an_answer_has_no_body(self):
        answer = self.ask("/healthz", "--head")
        self.assertEqual((answer.status, answer.body), (200, ""))

    def test_every_write_is_logged(self):
        self.ask("/config", *patch({"key": "a b", "value": number(4711)}))
        record = self.server.said()
        self.assertRegex(record, r"^warning velkor::http: write: PATCH /config by anybody "
                                 r"from 127\.0\.0\.1:\d+: a%20b -> 200\n$")


class RefusalsTest(ServerTest):
    """Each refusal by its status, type and the system's own text."""

    def assert_refused(self, answer, status, kind, detail):
        self.assertEqual(answer.status, status, answer.body)
        self.assertEqual(answer.headers["content-type"], "application/problem+json")
        problem = answer.json
        self.assertEqual((problem["status"], problem["type"]), (status, "/problems/" + kind))
        self.assertIn(detail, problem["detail"])
        self.assertTrue(problem["title"])

    def check(self, server, rows):
        for path, arguments, status, kind, detail in rows:
            with self.subTest(path=path, arguments=[each[:60] for each in arguments]):
                self.assert_refused(curl(server.url + path, *arguments), status, kind, detail)
        self.assertEqual(curl(server.url + "/healthz").status, 200)

    def test_by_the_server(self):
        server = self.serve("--allow-writes")
        get = MESSAGES + "ConfigurationGet"
        large = self.file("large", '{"key":"' + "x" * (1 << 20) + '"}')
        self.check(server, [
            (get, ["-d", "{"], 400, "bad-request", "Invalid JSON text"),
            (get, ["-d", "[]"], 400, "bad-request", "JSON text is not an object"),
            ("/config", patch({"key": "a", "value": 1}), 400, "bad-request", "value"),
            ("/config/%zz", [], 400, "bad-request", "percent-encoded"),
            ("/watch", [], 400, "bad-request", '"key" is missing'),
            (MESSAGES + "Nope", ["-d", "{}"], 404, "not-found",
             "Unknown message type: velkor/configuration/Nope"),
            ("/config/nobody", [], 404, "not-found",
             "No option with the specified key was found: nobody"),
            ("/nothing", [], 404, "not-found", "/nothing"),
            (get, [], 405, "method-not-allowed", "POST"),
            ("/config", ["-X", "DELETE"], 405, "method-not-allowed", "GET, HEAD, PATCH"),
            (get, ["--data-binary", "@" + large], 413, "too-large", ""),
            ("/healthz", ["-H", "X-Large: " + "x" * 20000], 431, "headers-too-large", ""),
        ])

    def test_by_the_store(self):
        server = self.serve(self.file("app.properties", "a = 1\n"), "--allow-writes",
                            "--property-root", self.folder)
        os.symlink("/etc/passwd", os.path.join(self.folder, "link"))
        os.mkfifo(os.path.join(self.folder, "pipe"))
        add = MESSAGES + "AddPropertyFileSource"
        self.check(server, [
            (MESSAGES + "ConfigurationSet", ["-d", '{"key":"a","source":"app"}'], 409,
             "not-writable", "Source not found or not writable: a, app"),
            ("/config", patch({"key": "a", "value": number(1), "source": "nobody"}), 409,
             "not-writable", "Source not found or not writable: a, nobody"),
            (add, ["-d", '{"name":"app","path":"app.properties"}'], 409, "duplicate-source",
             "Source with the requested name already exists: app"),
            (add, ["-d", '{"name":"n","path":"missing"}'], 422, "file-not-opened",
             "Property file could not be opened: missing: No such file or directory"),
            (add, ["-d", '{"name":"n","path":"pipe"}'], 422, "file-not-opened",
             "Not a regular file"),
            (add, ["-d", '{"name":"n","path":"/etc/passwd"}'], 403, "forbidden",
             "Property file not allowed: /etc/passwd"),
            (add, ["-d", '{"name":"n","path":"../etc/passwd"}'], 403, "forbidden",
             "Property file not allowed: ../etc/passwd"),
            (add, ["-d", '{"name":"n","path":"link"}'], 403, "forbidden",
             "Property file not allowed: link"),
        ])

    def test_without_leave_to_write(self):
        add = '{"name":"n","path":"/etc/hostname"}'
        self.check(self.serve(), [
            ("/config", patch({"key": "a", "value": number(1)}), 403, "forbidden", "write"),
            (MESSAGES + "ConfigurationSet", ["-d", '{"key":"a"}'], 403, "forbidden", "write"),
            (MESSAGES + "AddPropertyFileSource", ["-d", add], 403, "forbidden", "write"),
        ])

    def test_without_the_right_token(self):
        server = self.serve("--allow-writes", "--token-file", self.file("tokens", TOKENS))
        change = patch({"key": "a", "value": number(1)})
        bearer = lambda token: ["-H", "Authorization: Bearer " + token]
        self.check(server, [
            ("/config", [], 401, "unauthorised", ""),
            ("/config", bearer("guessed"), 401, "unauthorised", ""),
            ("/watch?key=a", [], 401, "unauthorised", ""),
            ("/metrics", [], 401, "unauthorised", ""),
            ("/config", [*change, *bearer("reader")], 403, "forbidden", ""),
        ])
        self.assertEqual(curl(server.url + "/config").headers["www-authenticate"], "Bearer")
        self.assertEqual(curl(server.url + "/config", *bearer("reader")).status, 200)
        self.assertEqual(curl(server.url + "/config", *change, *bearer("writer")).status, 200)
        self.assertNotIn("writer", server.said())

    def test_from_other_sites(self):
        server = self.serve("--allow-writes", "--host-name", "config.example")
        change = patch({"key": "a", "value": number(1)})
        self.check(server, [
            ("/config", ["-H", "Host: attacker.example"], 403, "forbidden", "attacker.example"),
            ("/config", [*change, "-H", "Origin: http://attacker.example"], 403, "forbidden",
             "attacker.example"),
            ("/config", [*change, "-H", "Origin: null"], 403, "forbidden", ""),
            ("/config", [*change, "-H", "Sec-Fetch-Site: cross-site"], 403, "forbidden", ""),
        ])
        for allowed in ["Host: config.example", "Host: localhost", "Origin: " + server.url]:
            self.assertEqual(curl(server.url + "/config", "-H", allowed).status, 200, allowed)

    def test_when_there_are_too_many_connections(self):
        server = self.serve("--max-connections", "1")
        with socket.create_connection(("127.0.0.1", server.port)) as held:
            held.sendall(b"GET /healthz HTTP/1.1\r\nHost: localhost\r\n\r\n")
            self.assertTrue(held.recv(1).startswith(b"H"))
            self.assert_refused(curl(server.url + "/healthz"), 503, "unavailable", "too many")

    def test_when_there_are_too_many_streams(self):
        server = self.serve("--max-streams", "1", "--set", "a=1")
        with socket.create_connection(("127.0.0.1", server.port)) as held:
            held.sendall(b"GET /watch?key=a HTTP/1.1\r\nHost: localhost\r\n\r\n")
            received = b""
            while b"data: " not in received:
                received += held.recv(4096)
            self.assert_refused(curl(server.url + "/watch?key=a"), 503, "unavailable", "too many")
        self.assertEqual(curl(server.url + "/healthz").status, 200)


class SocketTest(ServerTest):
    def test_serves_on_a_socket_of_the_file_system(self):
        path = os.path.join(self.folder, "socket")
        server = self.serve("--set", "a=1", listen=("unix:" + path,))
        self.assertEqual(server.urls, ["unix:" + path])
        self.assertEqual(os.stat(path).st_mode & 0o777, 0o600)
        answer = curl("http://localhost/config/a", "--unix-socket", path)
        self.assertEqual(answer.json["layers"][0]["source"], "command-line")
        self.assertEqual(server.end(), 0)
        self.assertFalse(os.path.exists(path))


if __name__ == "__main__":
    unittest.main()
