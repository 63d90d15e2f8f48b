"""The host library's former single-module name, kept so hosts written against it run
unchanged. New hosts import ``ludmox``."""

from ludmox import *  # noqa: F401,F403
from ludmox import __all__  # noqa: F401
