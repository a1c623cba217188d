"""The tool as a user runs it: a process with arguments, files or pipes, and an exit code.

A test file is run with the names of its tests (CLASS.METHOD) as arguments, each in a process of its own.
OMXBRIDGE_TOOL names the tool's executable.
"""

import json
import os
import pathlib
import select
import subprocess
import tempfile
import typing
import unittest

USAGE, INPUT, OUTPUT, DEVICE, INTERRUPTED = 2, 3, 4, 5, 130  # exit codes
LIMIT = 50  # seconds


class Ended(typing.NamedTuple):
    code: int  # negative: ended by that signal
    out: bytes
    err: str


class Process:
    """The tool at work. Killed at the end of the `with` block, should it still be there."""

    def __init__(self, *arguments, stdin="/dev/null", stdout=subprocess.PIPE, environment=None):
        own = {name: value for name, value in os.environ.items() if not name.startswith("OMXBRIDGE_")}
        self._err = tempfile.TemporaryFile()
        self._collected = b""
        with open(stdin, "rb", buffering=0) as source:
            self._process = subprocess.Popen(
                [os.environ["OMXBRIDGE_TOOL"], *map(str, arguments)], bufsize=0, stdin=source, stdout=stdout,
                stderr=self._err, env=own | (environment or {}))

    def __enter__(self):
        return self

    def __exit__(self, *_):
        self._process.kill()
        self._process.communicate()
        self._err.close()

    def wait_for_output(self, text):
        """Until that text has come on standard output."""
        output = self._process.stdout
        while text not in self._collected:
            ready, _, _ = select.select([output], [], [], LIMIT)
            piece = output.read(65536) if ready else b""
            if not piece:
                raise AssertionError(f"{text} did not come")
            self._collected += piece

    def close_output(self):
        """From now on nobody reads what it writes to standard output."""
        self._process.stdout.close()

    def signal(self, number):
        self._process.send_signal(number)

    def finish(self):
        out, _ = self._process.communicate(timeout=LIMIT)
        self._err.seek(0)
        return Ended(self._process.returncode, self._collected + (out or b""), self._err.read().decode())


def run(*arguments, **streams):
    with Process(*arguments, **streams) as process:
        return process.finish()


class TestCase(unittest.TestCase):
    """With a directory for the test's files, empty at first and gone afterwards."""

    def setUp(self):
        directory = tempfile.TemporaryDirectory(prefix="omxbridge.")
        self.addCleanup(directory.cleanup)
        self.directory = pathlib.Path(directory.name)

    def report(self, *arguments):
        """The figures of a run that ends well and says nothing else."""
        ended = run(*arguments, "--json")
        self.assertEqual((ended.code, ended.err), (0, ""))
        return json.loads(ended.out)

    def assertEnds(self, ended, code, part=""):
        self.assertEqual(ended.code, code, ended.err)
        self.assertIn(part, ended.err)

    def assertFields(self, figures, **expected):
        self.assertEqual({name: figures[name] for name in expected}, expected)

    def write(self, name, content):
        path = self.directory / name
        path.write_bytes(content)
        return path

    def names(self):
        return sorted(path.name for path in self.directory.iterdir())
