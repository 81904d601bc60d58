"""How serving begins and ends: refusals to start, signals, the console beside it."""

import http.client
import json
import os
import pty
import resource
import signal
import socket
import subprocess
import unittest

from python_test import Events
from serving import PATIENCE, PROGRAM, ServerTest, curl


def start(*arguments):
    """Exit status and messages of a program that does not start."""
    done = subprocess.run([PROGRAM, *arguments], capture_output=True, text=True,
                          stdin=subprocess.DEVNULL, timeout=PATIENCE)
    return done.returncode, done.stderr


class RefusalTest(ServerTest):
    def assert_refused(self, detail, *arguments):
        status, messages = start(*arguments)
        self.assertEqual(status, 2, messages)
        self.assertTrue(messages.startswith("velkor-config: "), messages)
        self.assertIn(detail, messages)
        self.assertEqual(messages.count("\n"), 1, messages)

    def test_other_addresses_need_tls_and_tokens(self):
        for address in ["0.0.0.0:0", "[::]:0"]:
            self.assert_refused("that needs TLS", "--listen", address)
            self.assert_refused("that needs a file of tokens", "--listen", address,
                                "--behind-proxy")

    def test_files_must_be_there_and_private(self):
        missing = os.path.join(self.folder, "missing")
        self.assert_refused("missing", "--listen", "0", "--token-file", missing)
        public = self.file("public", "read secret\n", 0o644)
        self.assert_refused("chmod 600", "--listen", "0", "--token-file", public)
        self.assert_refused("missing", "--listen", "0", "--tls-cert", missing, "--tls-key", missing)
        self.assert_refused("both a certificate and a key", "--listen", "0", "--tls-cert", missing)
        self.assert_refused("missing", "--listen", "0", "--property-root", missing)

    def test_endpoints_must_be_free_and_understood(self):
        self.assert_refused("no address to listen on", "--listen", "nowhere")
        with socket.create_server(("127.0.0.1", 0)) as taken:
            status, messages = start("--listen", str(taken.getsockname()[1]))
        self.assertEqual(status, 1)
        self.assertRegex(messages, r"^velkor-config: can't listen on 127\.0\.0\.1:\d+: .*\n$")

    def test_limits_must_make_sense(self):
        self.assert_refused("threads must be", "--listen", "0", "--listen-threads", "0")
        self.assert_refused("at least 1", "--listen", "0", "--max-streams", "0")
        self.assert_refused("--max-body-bytes few", "--listen", "0", "--max-body-bytes", "few")

    def test_the_options_are_for_serving(self):
        self.assert_refused("--allow-writes needs --listen", "--allow-writes")


class EndTest(ServerTest):
    def open_streams(self, server, count):
        streams = [Events(server, "/watch?key=a") for _ in range(count)]
        for stream in streams:
            self.addCleanup(stream.close)
            self.assertEqual(stream.next()[0], 1)
        return streams

    def test_signals_end_it_with_streams_open(self):
        for by in [signal.SIGTERM, signal.SIGINT]:
            with self.subTest(signal=by):
                server = self.serve("--set", "a=1")
                streams = self.open_streams(server, 20)
                self.assertEqual(server.end(by), 0)
                for stream in streams:
                    self.assertIsNone(stream.next())
                with self.assertRaises(ConnectionRefusedError):
                    socket.create_connection(("127.0.0.1", server.port))

    def test_a_second_signal_changes_nothing(self):
        server = self.serve("--set", "a=1")
        self.open_streams(server, 5)
        for _ in range(5):
            server.process.send_signal(signal.SIGTERM)
            server.process.send_signal(signal.SIGINT)
        self.assertEqual(server.wait(), 0)

    def test_a_log_that_nobody_reads_holds_nobody(self):
        server = self.serve("--allow-writes", stderr=subprocess.PIPE)
        body = json.dumps({"changes": [{"key": "k" * 900, "unset": True}]})
        connection = http.client.HTTPConnection("127.0.0.1", server.port, timeout=PATIENCE)
        self.addCleanup(connection.close)
        for _ in range(200):
            connection.request("PATCH", "/config", body)
            response = connection.getresponse()
            self.assertEqual((response.status, response.read())[0], 200)
        self.assertEqual(server.end(), 0)

    def test_a_hangup_ends_it_and_takes_its_socket_away(self):
        for arguments in [(), ("--console",)]:
            for by in [signal.SIGHUP, signal.SIGINT, signal.SIGTERM]:
                with self.subTest(arguments=arguments, signal=by):
                    path = os.path.join(self.folder, "socket")
                    server = self.serve(*arguments, listen=("unix:" + path,),
                                        stdin=subprocess.PIPE)
                    self.assertEqual(server.end(by), 0)
                    self.assertFalse(os.path.exists(path))

    def test_a_client_in_the_middle_of_a_request_holds_nothing(self):
        server = self.serve()
        with socket.create_connection(("127.0.0.1", server.port)) as slow:
            slow.sendall(b"POST /velkor/configuration/ConfigurationGet HTTP/1.1\r\n"
                         b"Host: localhost\r\nContent-Length: 100\r\n\r\n{")
            self.assertEqual(curl(server.url + "/healthz").status, 200)
            self.assertEqual(server.end(), 0)

    def test_what_lasts_is_kept_when_a_write_is_answered(self):
        state = os.path.join(self.folder, "state")
        server = self.serve("--allow-writes", "--state", state)
        for body in ['{"changes":[{"key":"a","value":{"type":"int","value":7}}]}']:
            self.assertEqual(curl(server.url + "/config", "-X", "PATCH", "-d", body).status, 200)
        set_b = '{"key":"b","value":{"type":"int","value":8}}'
        curl(server.url + "/velkor/configuration/ConfigurationSet", "-d", set_b)
        server.end(signal.SIGKILL)
        again = self.serve("--state", state)
        for key, value in [("a", 7), ("b", 8)]:
            layer = curl(again.url + "/config/" + key).json["layers"][0]
            self.assertEqual(layer, {"source": "state", "value": {"type": "int", "value": value}})
        history = curl(again.url + "/history").json
        self.assertEqual([change["key"] for change in history["changes"]], ["b", "a"])
        author = subprocess.run(["id", "-un"], capture_output=True, text=True).stdout.strip()
        self.assertEqual({change["author"] for change in history["changes"]}, {author})

    def test_the_usual_limit_of_descriptors_is_none_of_connections(self):
        few = lambda: resource.setrlimit(resource.RLIMIT_NOFILE,
                                         (40, resource.getrlimit(resource.RLIMIT_NOFILE)[1]))
        server = self.serve("--set", "a=1", preexec_fn=few)
        self.open_streams(server, 100)

    def test_files_are_followed(self):
        path = self.file("app.properties", "a = 1\n")
        server = self.serve(path)
        watch = self.open_streams(server, 1)[0]
        self.file("next", "a = 2\n")
        os.rename(os.path.join(self.folder, "next"), path)
        self.assertEqual(watch.next(), (2, {"type": "string", "value": "2"}))

    def test_a_file_that_is_missing_is_no_reason_not_to_serve(self):
        server = self.serve(os.path.join(self.folder, "missing"))
        self.assertEqual(curl(server.url + "/readyz").status, 503)
        self.assertEqual(server.end(), 3)


class ConsoleTest(ServerTest):
    def test_standard_input_is_not_read_without_it(self):
        server = self.serve("--set", "a=1", stdin=subprocess.PIPE)
        server.process.stdin.write("quit\n")
        server.process.stdin.close()
        self.assertEqual(curl(server.url + "/config/a").status, 200)

    def test_lines_are_carried_out_before_it_serves(self):
        server = self.serve("-c", "set a 5")
        self.assertEqual(curl(server.url + "/config/a").json["layers"][0]["source"], "override")

    def test_its_commands_and_clients_have_the_same_store(self):
        server = self.serve("--console", "--allow-writes", stdin=subprocess.PIPE)
        server.process.stdin.write("set a 5\nget a\n")
        server.process.stdin.flush()
        self.assertEqual(server.process.stdout.readline(), "5\n")
        self.assertEqual(curl(server.url + "/config/a").json["layers"][0]["value"]["value"], 5)
        body = '{"changes":[{"key":"a","value":{"type":"int","value":6}}]}'
        curl(server.url + "/config", "-X", "PATCH", "-d", body)
        server.process.stdin.write("get a\n")
        server.process.stdin.flush()
        self.assertEqual(server.process.stdout.readline(), "6\n")

    def test_its_end_ends_serving(self):
        server = self.serve("--console", stdin=subprocess.PIPE)
        server.process.stdin.write("quit\n")
        server.process.stdin.flush()
        self.assertEqual(server.wait(), 0)

    def test_sigterm_ends_it_while_it_waits_for_a_command(self):
        server = self.serve("--console", stdin=subprocess.PIPE)
        self.assertEqual(server.end(), 0)

    def test_signals_end_it_on_a_terminal(self):
        for by in [signal.SIGTERM, signal.SIGHUP, signal.SIGINT]:
            with self.subTest(signal=by):
                self.check_end_on_a_terminal(by)

    def check_end_on_a_terminal(self, by):
        path = os.path.join(self.folder, "socket")
        terminal, other = pty.openpty()
        self.addCleanup(os.close, terminal)
        process = subprocess.Popen([PROGRAM, "--listen", "0", "--listen", "unix:" + path,
                                    "--console"], stdin=other, stdout=other,
                                   stderr=subprocess.DEVNULL, start_new_session=True)
        os.close(other)
        self.addCleanup(process.kill)
        shown = b""
        while b"velkor> " not in shown:
            shown += os.read(terminal, 4096)
        self.assertIn(b"Listening on http://127.0.0.1:", shown)
        process.send_signal(by)
        self.assertEqual(process.wait(PATIENCE), 0)
        self.assertFalse(os.path.exists(path))


if __name__ == "__main__":
    unittest.main()
