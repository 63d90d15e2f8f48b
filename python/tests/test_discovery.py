"""Which ludmoxd a client starts, and the error when there is none."""

import os
import stat
import tempfile
import unittest
from unittest import mock

from ludmox import Client, ServerNotFoundError, find_server


class DiscoveryTest(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.root = folder.name
        self.explicit = self.executable("explicit/ludmoxd")
        self.configured = self.executable("configured/ludmoxd")
        self.on_path = self.executable("bin/ludmoxd")
        self.renamed = self.executable("bin/ludmoxd-dev")
        self.plain_file = self.file("plain/ludmoxd", mode=0o644)
        os.makedirs(os.path.join(self.root, "dirs/ludmoxd"))
        self.path = os.pathsep.join(
            [os.path.join(self.root, "dirs"), os.path.join(self.root, "bin")])

    def file(self, name, mode):
        path = os.path.join(self.root, name)
        os.makedirs(os.path.dirname(path), exist_ok=True)
        with open(path, "w") as f:
            f.write("#!/bin/sh\n")
        os.chmod(path, mode)
        return path

    def executable(self, name):
        return self.file(name, stat.S_IRWXU)

    def test_order_of_the_places(self):
        cases = [
            # name, path argument, LUDMOX_LUDMOXD, PATH, expected
            ("argument wins over everything", "explicit", "configured", True, "explicit"),
            ("variable wins over the PATH", None, "configured", True, "configured"),
            ("PATH without the variable", None, None, True, "on_path"),
            ("PATH when the variable is empty", None, "", True, "on_path"),
            ("variable with a bare name is looked up on the PATH", None, "ludmoxd-dev", True,
             "renamed"),
            ("argument with a bare name is looked up on the PATH", "ludmoxd-dev", None, True,
             "renamed"),
        ]
        for name, argument, variable, with_path, expected in cases:
            with self.subTest(name):
                environ = {"PATH": self.path if with_path else ""}
                if variable is not None:
                    environ["LUDMOX_LUDMOXD"] = getattr(self, variable, variable)
                given = getattr(self, argument, argument) if argument else None
                self.assertEqual(os.path.realpath(find_server(given, environ)),
                                 os.path.realpath(getattr(self, expected)))

    def test_nothing_to_start_is_an_error_naming_where_it_looked(self):
        missing = os.path.join(self.root, "nowhere/ludmoxd")
        cases = [
            # name, path argument, LUDMOX_LUDMOXD, PATH, texts the message must hold
            ("neither variable nor PATH", None, None, "",
             ["LUDMOX_LUDMOXD is not set", "no ludmoxd on the PATH"]),
            ("only a folder of that name on the PATH", None, None, "dirs",
             ["LUDMOX_LUDMOXD is not set", "no ludmoxd on the PATH"]),
            # A variable that names nothing is not replaced by another server from the PATH.
            ("variable names a missing file", None, missing, "bin",
             ["LUDMOX_LUDMOXD", missing, "PATH"]),
            ("variable names a file that is not executable", None, "plain_file", "bin",
             ["LUDMOX_LUDMOXD", "plain/ludmoxd", "not an executable"]),
            ("argument names a missing file", missing, "configured", "bin", [missing]),
        ]
        for name, argument, variable, path, texts in cases:
            with self.subTest(name):
                environ = {"PATH": os.path.join(self.root, path) if path else ""}
                if variable is not None:
                    environ["LUDMOX_LUDMOXD"] = getattr(self, variable, variable)
                with self.assertRaises(ServerNotFoundError) as caught:
                    find_server(argument, environ)
                for text in texts:
                    self.assertIn(text, str(caught.exception))
                self.assertIsInstance(caught.exception, FileNotFoundError)

    def test_client_reports_a_missing_server_before_starting_anything(self):
        environ = {"PATH": os.path.join(self.root, "plain")}
        with mock.patch.dict(os.environ, environ, clear=True), \
                mock.patch("subprocess.Popen") as popen:
            with self.assertRaises(ServerNotFoundError):
                Client()
            popen.assert_not_called()


if __name__ == "__main__":
    unittest.main()
