"""The package as a whole: its version and the names hosts import."""

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


class CompatibilityTest(unittest.TestCase):
    def test_former_module_name_gives_the_same_objects(self):
        import ludmox_client
        for name in ("Array", "Array2D", "Client", "ComError", "EMPTY", "ErrorValue", "Event",
                     "MISSING", "NOTHING", "Proxy", "COMPONENT_ERROR", "INVALID_PARAMS"):
            with self.subTest(name):
                self.assertIs(getattr(ludmox_client, name), getattr(ludmox, name))


if __name__ == "__main__":
    unittest.main()
