"""The package carries the project's version."""

import os
import re
import unittest

import ludmox

TOP_CMAKELISTS = os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "..",
                              "CMakeLists.txt")


class VersionTest(unittest.TestCase):
    @unittest.skipUnless(os.path.exists(TOP_CMAKELISTS), "not in a checkout of the project")
    def test_is_the_version_of_the_cmake_project(self):
        with open(TOP_CMAKELISTS) as f:
            found = re.search(r"project\(\s*LudMox\s+VERSION\s+([0-9.]+)", f.read())
        self.assertIsNotNone(found, "no project(LudMox VERSION ...) in CMakeLists.txt")
        self.assertEqual(ludmox.__version__, found.group(1),
                         "bump python/ludmox/_version.py with the project's version")


if __name__ == "__main__":
    unittest.main()
