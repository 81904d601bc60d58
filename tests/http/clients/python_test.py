"""The interface by the standard library of Python: connections that stay, streams, TLS."""

import http.client
import json
import ssl
import unittest

from serving import PATIENCE, ServerTest


class Events:
    """An event stream that is read on a connection of its own."""

    def __init__(self, server, path):
        self.connection = http.client.HTTPConnection("127.0.0.1", server.port, timeout=PATIENCE)
        self.connection.request("GET", path)
        self.response = self.connection.getresponse()

    def next(self):
        """Number and data of the next event; nothing when the stream is over."""
        fields = {}
        while line := self.response.readline().decode().rstrip("\n"):
            name, _, value = line.partition(": ")
            fields[name] = value
        if "data" not in fields:
            return None
        return int(fields["id"]), json.loads(fields["data"])

    def close(self):
        self.connection.close()


def number(value):
    return {"type": "int", "value": value}


class PythonTest(ServerTest):
    def setUp(self):
        super().setUp()
        self.server = self.serve("--allow-writes", "--set", "a=1")
        self.connection = http.client.HTTPConnection("127.0.0.1", self.server.port,
                                                     timeout=PATIENCE)
        self.addCleanup(self.connection.close)

    def ask(self, method, path, content=None):
        body = None if content is None else json.dumps(content)
        self.connection.request(method, path, body)
        response = self.connection.getresponse()
        return response.status, json.loads(response.read())

    def write(self, *changes):
        return self.ask("PATCH", "/config", {"changes": list(changes)})

    def events(self, path):
        events = Events(self.server, path)
        self.addCleanup(events.close)
        return events

    def test_a_connection_takes_one_request_after_the_other(self):
        self.assertEqual(self.ask("GET", "/config/a")[0], 200)
        first = self.connection.sock.getsockname()
        self.assertEqual(self.ask("GET", "/config/nobody")[0], 404)
        self.assertEqual(self.write({"key": "b", "value": number(2)})[0], 200)
        self.assertEqual(self.connection.sock.getsockname(), first)

    def test_a_watch_tells_the_value_and_its_changes(self):
        watch = self.events("/watch?key=a")
        self.assertEqual(watch.response.getheader("content-type"), "text/event-stream")
        self.assertEqual(watch.next(), (1, number(1)))
        self.write({"key": "a", "value": number(2)})
        self.assertEqual(watch.next(), (2, number(2)))
        self.write({"key": "a", "unset": True})
        self.assertEqual(watch.next(), (3, number(1)))

    def test_changes_are_told_by_prefix(self):
        changes = self.events("/changes?prefix=s.")
        self.write({"key": "a", "value": number(2)}, {"key": "s.b", "value": number(3)})
        self.assertEqual(changes.next(),
                         (1, {"key": "s.b", "value": number(3), "source": "override"}))
        self.write({"key": "s.b", "unset": True})
        self.assertEqual(changes.next(), (2, {"key": "s.b", "gone": True}))

    def test_all_or_nothing_is_written(self):
        status, problem = self.write({"key": "b", "value": number(2)},
                                     {"key": "c", "value": number(3), "source": "nobody"})
        self.assertEqual((status, problem["type"]), (409, "/problems/not-writable"))
        self.assertEqual(self.ask("GET", "/config/b")[0], 404)

    def test_every_kind_of_value_goes_there_and_back(self):
        values = [
            ("bool", True), ("int", -5), ("uint", 4294967295), ("double", 0.25),
            ("string", "ä €"), ("ustring", "ä €"), ("boolArray", [True, False]),
            ("intArray", [1, -2]), ("uintArray", [1]), ("doubleArray", [0.5]),
            ("stringArray", ["", "b"]), ("ustringArray", ["€"]),
        ]
        for tag, content in values:
            value = {"type": tag, "value": content}
            with self.subTest(value=value):
                self.write({"key": "k", "value": value})
                self.assertEqual(self.ask("GET", "/config/k")[1]["layers"][0]["value"], value)

    def test_a_chunked_body_is_a_body(self):
        body = iter([b'{"changes":[{"key":"b","value"', b':{"type":"int","value":2}}]}'])
        self.connection.request("PATCH", "/config", body, encode_chunked=True,
                                headers={"Transfer-Encoding": "chunked"})
        response = self.connection.getresponse()
        self.assertEqual(response.status, 200, response.read())


class TlsTest(ServerTest):
    def setUp(self):
        super().setUp()
        self.certificate, self.key = self.make_certificate()
        self.tls = ("--tls-cert", self.certificate, "--tls-key", self.key)

    def test_serves_over_tls(self):
        server = self.serve("--set", "a=1", *self.tls)
        self.assertTrue(server.url.startswith("https://127.0.0.1:"))
        trusting = ssl.create_default_context(cafile=self.certificate)
        connection = http.client.HTTPSConnection("127.0.0.1", server.port, context=trusting,
                                                 timeout=PATIENCE)
        self.addCleanup(connection.close)
        for _ in range(2):
            connection.request("GET", "/config/a")
            self.assertEqual(json.loads(connection.getresponse().read())["key"], "a")

    def test_old_versions_are_refused(self):
        server = self.serve(*self.tls)
        old = ssl.create_default_context(cafile=self.certificate)
        old.set_ciphers("ALL:@SECLEVEL=0")
        old.minimum_version = old.maximum_version = ssl.TLSVersion.TLSv1_1
        connection = http.client.HTTPSConnection("127.0.0.1", server.port, context=old,
                                                 timeout=PATIENCE)
        with self.assertRaises(OSError):
            connection.request("GET", "/healthz")

    def test_plain_http_finds_nothing_there(self):
        server = self.serve(*self.tls)
        connection = http.client.HTTPConnection("127.0.0.1", server.port, timeout=PATIENCE)
        self.addCleanup(connection.close)
        with self.assertRaises((http.client.HTTPException, OSError)):
            connection.request("GET", "/healthz")
            connection.getresponse()

    def test_other_addresses_are_served_with_tokens(self):
        tokens = self.file("tokens", "read secret\n")
        server = self.serve(*self.tls, "--token-file", tokens, listen=("0.0.0.0:0",))
        trusting = ssl.create_default_context(cafile=self.certificate)
        for headers, status in [({}, 401), ({"Authorization": "Bearer secret"}, 200)]:
            connection = http.client.HTTPSConnection("127.0.0.1", server.port, context=trusting,
                                                     timeout=PATIENCE)
            self.addCleanup(connection.close)
            connection.request("GET", "/config", headers=headers)
            self.assertEqual(connection.getresponse().status, status)


if __name__ == "__main__":
    unittest.main()
