"""The package's version: the project's version in the top CMakeLists.txt.

Kept as a literal so that setuptools can read it without importing the package and an
uninstalled checkout still knows it; the CTest test ``python_package_version`` fails when it
differs from the version CMake was configured with.
"""

__version__ = "1.0.0"
