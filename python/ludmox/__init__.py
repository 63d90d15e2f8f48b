"""Host library for ludmoxd, the LUD Mox automation server (standard library only).

Starts ``ludmoxd`` and talks JSON-RPC 2.0 with it over its standard input and output.
Objects of the component come back as proxies with attribute access by member name::

    from ludmox import Client

    with Client() as mox:                      # ludmoxd from $LUDMOX_LUDMOXD or the PATH
        engine = mox.create("MoxEngine115")
        engine.Init(3, True, 0, 0)
        engine.SetLogonInfo(2, "server", "database", "user", "password")
        report = engine.GetReports().Item("/reports/orders.rpt")
        report.DefaultPrinter = "PDF"
        print(report.Status.Progress)

Reading an attribute reads a property or gives a callable method; assigning an attribute
assigns the property. Values map as follows: ``None`` is Null, ``EMPTY`` is Empty,
``NOTHING`` is an empty object reference, ``MISSING`` skips an optional argument,
``decimal.Decimal`` is Currency, ``datetime.datetime`` is Date (local time), lists and
tuples are zero-based arrays (``Array`` and ``Array2D`` carry other bounds).

Errors of the component and of the call itself raise ``ComError`` with ``number``,
``source`` and ``description``. Events reach handlers registered with ``Client.on``; a
handler may change by-reference arguments through ``event.args`` and may call back into
the component.
"""

from ._version import __version__
from .client import Client, Event, EventHandler, Proxy
from .discovery import ENVIRONMENT_VARIABLE, find_server
from .errors import (
    COMPONENT_ERROR, INVALID_PARAMS, INVALID_REQUEST, METHOD_NOT_FOUND, PARSE_ERROR, ComError,
    ServerNotFoundError,
)
from .values import EMPTY, MISSING, NOTHING, Array, Array2D, ErrorValue

__all__ = [
    "Array", "Array2D", "COMPONENT_ERROR", "Client", "ComError", "EMPTY", "ENVIRONMENT_VARIABLE",
    "ErrorValue", "Event", "EventHandler", "INVALID_PARAMS", "INVALID_REQUEST", "MISSING",
    "METHOD_NOT_FOUND", "NOTHING", "PARSE_ERROR", "Proxy", "ServerNotFoundError",
    "__version__", "find_server",
]
