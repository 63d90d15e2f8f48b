"""Finding the ludmoxd executable to start."""

from __future__ import annotations

import os
import shutil
from typing import Mapping, Optional, Union

from .errors import ServerNotFoundError

ENVIRONMENT_VARIABLE = "LUDMOX_LUDMOXD"
"""The environment variable that names the server to start."""
SERVER_NAME = "ludmoxd"
"""The server's file name, looked up on the PATH."""


def find_server(path: Union[str, "os.PathLike[str]", None] = None,
                environ: Optional[Mapping[str, str]] = None) -> str:
    """The server to start: ``path`` when given, else ``$LUDMOX_LUDMOXD`` when set and not
    empty, else ``ludmoxd`` on the PATH. A name without a folder (in ``path`` or the
    variable) is looked up on the PATH too.

    ``environ`` is the environment to read the variable and the PATH from (default: this
    process's). Raises ``ServerNotFoundError`` when the chosen place holds no executable
    file. A variable that names no server is an error rather than a reason to take another
    one from the PATH: that could be a different build than the one the host asked for.
    """
    environ = os.environ if environ is None else environ
    search_path = environ.get("PATH", os.defpath)
    if path:
        given = os.fspath(path)
        found = _resolve(given, search_path)
        if found is None:
            raise ServerNotFoundError(f"cannot start ludmoxd: {given!r} is not an executable file")
        return found
    configured = environ.get(ENVIRONMENT_VARIABLE)
    if configured:
        found = _resolve(configured, search_path)
        if found is None:
            raise ServerNotFoundError(
                f"cannot start ludmoxd: {ENVIRONMENT_VARIABLE} is {configured!r}, which is not"
                f" an executable file (unset it to use {SERVER_NAME} from the PATH)")
        return found
    found = shutil.which(SERVER_NAME, path=search_path)
    if found is None:
        raise ServerNotFoundError(
            f"cannot start ludmoxd: {ENVIRONMENT_VARIABLE} is not set and there is no"
            f" {SERVER_NAME} on the PATH; set {ENVIRONMENT_VARIABLE} to the server or pass"
            " its path to Client()")
    return found


def _resolve(candidate: str, search_path: str) -> Optional[str]:
    if os.path.dirname(candidate):
        executable = os.path.isfile(candidate) and os.access(candidate, os.X_OK)
        return candidate if executable else None
    return shutil.which(candidate, path=search_path)
