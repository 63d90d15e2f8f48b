"""Errors the host library raises."""

from __future__ import annotations

from typing import Any, Mapping, Optional

# JSON-RPC error codes the server answers with.
COMPONENT_ERROR = -32000
INVALID_REQUEST = -32600
METHOD_NOT_FOUND = -32601
INVALID_PARAMS = -32602
PARSE_ERROR = -32700


class ComError(Exception):
    """An error answer: the component's error (``code`` -32000) or a failed call.

    ``number`` is the error number as a signed 32-bit value: the component's own number,
    or the dispatch error number (0x80020003 member not found, 0x80020005 type mismatch,
    0x8002000E bad parameter count, 0x8002000F parameter not optional) of a call that did
    not reach the member, or the JSON-RPC code when neither applies. ``code`` is the
    JSON-RPC error code and ``data`` the answer's error data (for a call that cannot be
    bound, ``data["argument"]`` is the 0-based position of the argument to blame).
    """

    def __init__(self, number: Optional[int], source: str, description: str,
                 code: Optional[int] = None, data: Optional[Mapping[str, Any]] = None) -> None:
        super().__init__(number, source, description)
        self.number = number
        self.source = source
        self.description = description
        self.code = code
        self.data = data

    def __str__(self) -> str:
        return f"{self.number}, {self.source}, {self.description}"


class ServerNotFoundError(FileNotFoundError):
    """No ludmoxd to start: the path given, ``$LUDMOX_LUDMOXD`` or the PATH named none
    that is an executable file. The message names every place that was looked at."""
