"""Runs velkor-config as a server for tests, and asks it by curl."""

import json
import os
import shutil
import signal
import subprocess
import tempfile
import unittest

PROGRAM = os.environ["VELKOR_CONFIG_PROGRAM"]
PATIENCE = 60  # seconds, after which something hangs
ADDRESS = "Listening on "


class Server:
    """The program while it serves. What it says on standard error is kept in `errors`."""

    def __init__(self, *arguments, listen=("127.0.0.1:0",), stdin=subprocess.DEVNULL,
                 stderr=None, preexec_fn=None):
        command = [PROGRAM]
        for endpoint in listen:
            command += ["--listen", endpoint]
        self.errors = tempfile.TemporaryFile("w+")
        self.process = subprocess.Popen([*command, *arguments], stdin=stdin, text=True,
                                        stdout=subprocess.PIPE, stderr=stderr or self.errors,
                                        preexec_fn=preexec_fn)
        self.urls = [self._next_url() for _ in listen]
        self.url = self.urls[0].rstrip("/")
        self.port = int(self.url.rsplit(":", 1)[1]) if "//" in self.url else 0

    def _next_url(self):
        line = self.process.stdout.readline()
        if not line.startswith(ADDRESS):
            raise AssertionError(f"served nothing: {line!r} {self.said()!r}")
        return line[len(ADDRESS):].rstrip("\n")

    def said(self):
        self.errors.seek(0)
        return self.errors.read()

    def wait(self):
        """The exit status, once the program ends by itself."""
        return self.process.wait(PATIENCE)

    def end(self, by=signal.SIGTERM):
        """Ends the program by a signal, and gives its exit status."""
        self.process.send_signal(by)
        return self.wait()

    def close(self):
        self.process.kill()
        self.process.wait()
        self.process.stdout.close()
        for stream in [self.process.stdin, self.process.stderr]:
            if stream:
                stream.close()
        self.errors.close()


class ServerTest(unittest.TestCase):
    """A test with servers, and a folder for its files; both end with it."""

    def setUp(self):
        self.folder = tempfile.mkdtemp(prefix="velkor-")
        self.addCleanup(shutil.rmtree, self.folder)

    def serve(self, *arguments, **how):
        server = Server(*arguments, **how)
        self.addCleanup(server.close)
        return server

    def file(self, name, content, mode=0o600):
        path = os.path.join(self.folder, name)
        with open(path, "w", encoding="utf-8") as file:
            file.write(content)
        os.chmod(path, mode)
        return path

    def make_certificate(self):
        """Paths of a new certificate for this machine, and of its key."""
        certificate = os.path.join(self.folder, "certificate.pem")
        key = os.path.join(self.folder, "key.pem")
        subprocess.run(["openssl", "req", "-x509", "-newkey", "rsa:2048", "-nodes", "-days", "2",
                        "-subj", "/CN=localhost",
                        "-addext", "subjectAltName=DNS:localhost,IP:127.0.0.1",
                        "-keyout", key, "-out", certificate],
                       check=True, capture_output=True)
        return certificate, key


class Answer:
    """What curl has received."""

    def __init__(self, raw):
        head, _, self.body = raw.partition("\r\n\r\n")
        lines = head.split("\r\n")
        self.status = int(lines[0].split()[1])
        self.headers = {name.lower(): value.strip()
                        for name, _, value in (line.partition(":") for line in lines[1:])}

    @property
    def json(self):
        return json.loads(self.body)


def curl(url, *arguments):
    """Asks by curl, which gives up when something hangs."""
    done = subprocess.run(["curl", "--silent", "--show-error", "--include", "--globoff", "--noproxy", "*",
                           "--max-time", str(PATIENCE), *arguments, url],
                          capture_output=True, check=True)
    return Answer(done.stdout.decode())
