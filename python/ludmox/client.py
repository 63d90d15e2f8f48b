"""The host's end of the conversation with ludmoxd: the client, proxies and events.

Starts ``ludmoxd`` and talks JSON-RPC 2.0 with it over its standard input and output.
Objects of the component come back as proxies with attribute access by member name.
"""

from __future__ import annotations

import datetime
import decimal
import json
import os
import subprocess
import weakref
from typing import (
    IO, Any, Callable, Dict, Iterator, List, Mapping, Optional, Sequence, Tuple, Union, cast,
)

from .discovery import find_server
from .errors import COMPONENT_ERROR, INVALID_PARAMS, METHOD_NOT_FOUND, ComError
from .values import EMPTY, MISSING, NOTHING, Array, Array2D, ErrorValue

EventHandler = Callable[["Event"], Optional[Sequence[Any]]]
"""A handler of ``Client.on``: it may return the event's final arguments instead of
assigning them to ``event.args``."""


class Event:
    """One event raised by the component. Handlers change by-reference arguments by
    assigning to ``args``; assignments to by-value arguments are ignored by the server."""

    def __init__(self, source: Optional[Proxy], name: str, dispid: Optional[int],
                 args: List[Any]) -> None:
        self.source = source
        self.name = name
        self.dispid = dispid
        self.args = args

    def __repr__(self) -> str:
        return f"Event({self.name!r}, {self.args!r})"


# Classes the component hands out that its type library does not list: member kinds as
# the type library gives them ("indexed": a property read with arguments).
_PLATFORM_CLASSES: Dict[str, Dict[str, str]] = {
    "Scripting.Dictionary": {
        "item": "indexed", "add": "method", "count": "get", "exists": "method",
        "items": "method", "keys": "method", "remove": "method", "removeall": "method",
        "comparemode": "get",
    },
    "Collection": {
        "item": "method", "add": "method", "count": "method", "remove": "method",
    },
}


class Proxy:
    """A component object held by the host. The same object always comes back as the same
    proxy; the server's references are given back when the proxy is garbage-collected or
    released with ``Client.release``."""

    __slots__ = ("_client", "_handle", "_class", "_refs", "__weakref__")

    def __init__(self, client: Client, handle: int, class_name: Optional[str] = None) -> None:
        object.__setattr__(self, "_client", client)
        object.__setattr__(self, "_handle", handle)
        object.__setattr__(self, "_class", class_name)
        object.__setattr__(self, "_refs", 1)

    @property
    def handle(self) -> int:
        """The server's handle of the object."""
        return self._handle

    @property
    def class_name(self) -> Optional[str]:
        """The class as far as the host can tell (from the type library), or None."""
        return self._class

    def __getattr__(self, name: str) -> Any:
        if name.startswith("_"):
            raise AttributeError(name)
        kind = self._client._member_kind(self._class, name)
        if kind == "property":
            return self._client.invoke(self, name, kind="get")
        return _BoundMember(self, name, kind)

    def __setattr__(self, name: str, value: Any) -> None:
        if name.startswith("_"):
            object.__setattr__(self, name, value)
            return
        kind = "putref" if isinstance(value, Proxy) or value is NOTHING else "put"
        self._client.invoke(self, name, value, kind=kind)

    def __getitem__(self, key: Any) -> Any:
        args = key if isinstance(key, tuple) else (key,)
        return self._client._call_default(self, None, args)

    def __setitem__(self, key: Any, value: Any) -> None:
        args = (key if isinstance(key, tuple) else (key,)) + (value,)
        kind = "putref" if isinstance(value, Proxy) or value is NOTHING else "put"
        self._client._call_default(self, kind, args)

    def __iter__(self) -> Iterator[Any]:
        return iter(self._client.enumerate(self))

    def __len__(self) -> int:
        try:
            return self._client.invoke(self, "Count")
        except ComError as error:
            if error.code == INVALID_PARAMS:
                raise TypeError(f"{self!r} has no Count") from error
            raise

    def __bool__(self) -> bool:
        return True

    def invoke(self, member: Union[str, int], *args: Any, kind: Optional[str] = None) -> Any:
        """Calls a member by name (or dispatch id, given as an int); the result only."""
        return self._client.invoke(self, member, *args, kind=kind)

    def invoke_full(self, member: Union[str, int], *args: Any,
                    kind: Optional[str] = None) -> Tuple[Any, List[Any]]:
        """Calls a member; returns (result, final arguments) for by-reference results."""
        return self._client.invoke_full(self, member, *args, kind=kind)

    def __repr__(self) -> str:
        return f"<Proxy {self._class or 'object'} #{self._handle}>"

    def __del__(self) -> None:
        client = self._client
        if client is not None:
            client._forget(self)


class _BoundMember:
    """A member of a proxy: call it to call the method (or read an indexed property);
    ``get``, ``put`` and ``full`` are explicit."""

    def __init__(self, proxy: Proxy, name: str, kind: Optional[str]) -> None:
        self._proxy = proxy
        self._name = name
        self._kind = kind

    def __call__(self, *args: Any) -> Any:
        kind = "get" if self._kind == "indexed" else None
        return self._proxy._client.invoke(self._proxy, self._name, *args, kind=kind)

    def get(self, *args: Any) -> Any:
        return self._proxy._client.invoke(self._proxy, self._name, *args, kind="get")

    def put(self, *args: Any) -> Any:
        return self._proxy._client.invoke(self._proxy, self._name, *args, kind="put")

    def full(self, *args: Any) -> Tuple[Any, List[Any]]:
        return self._proxy._client.invoke_full(self._proxy, self._name, *args)

    def __repr__(self) -> str:
        return f"<member {self._name} of {self._proxy!r}>"


class Client:
    """A running ``ludmoxd`` and the host's end of the conversation.

    ``path`` is the server to start; without it ``$LUDMOX_LUDMOXD``, then ``ludmoxd`` on
    the PATH (see ``find_server``, which raises ``ServerNotFoundError`` when there is none).
    ``args`` are its command-line arguments and ``env`` its environment (default: this
    process's). ``stderr`` is passed to ``subprocess.Popen`` (the server writes diagnostics
    there). The client owns the process: ``close`` ends it.
    """

    def __init__(self, path: Union[str, "os.PathLike[str]", None] = None,
                 args: Sequence[str] = (), env: Optional[Mapping[str, str]] = None,
                 stderr: Union[None, int, IO[Any]] = None) -> None:
        path = find_server(path)
        self._process = subprocess.Popen(
            [path, *args], stdin=subprocess.PIPE, stdout=subprocess.PIPE, stderr=stderr,
            env=env)
        # Both are pipes: Popen was asked for them.
        self._input = cast(IO[bytes], self._process.stdin)
        self._output = cast(IO[bytes], self._process.stdout)
        self._next_id = 1
        self._answers: Dict[int, Dict[str, Any]] = {}
        self._proxies: weakref.WeakValueDictionary[int, Proxy] = weakref.WeakValueDictionary()
        self._releases: List[int] = []
        self._handlers: Dict[Tuple[int, str], Tuple[EventHandler, Proxy]] = {}
        self._typelib: Optional[Dict[str, Any]] = None
        self._classes: Dict[str, Dict[str, Any]] = {}
        self._closed = False

    # Lifetime -----------------------------------------------------------------------

    def __enter__(self) -> Client:
        return self

    def __exit__(self, *exc: object) -> None:
        self.close()

    def close(self, timeout: Optional[float] = 30) -> int:
        """Closes the server's input (it then releases every object) and waits for it to
        end; returns its exit code."""
        if not self._closed:
            self._closed = True
            try:
                self._input.close()
            except OSError:
                pass
        code = self._process.wait(timeout=timeout)
        self._output.close()
        return code

    def shutdown(self) -> int:
        """Asks the server to end; it releases every object."""
        self._request("shutdown", {})
        return self.close()

    @property
    def process(self) -> subprocess.Popen[bytes]:
        """The server's process."""
        return self._process

    # The protocol -------------------------------------------------------------------

    def typelib(self) -> Dict[str, Any]:
        """The component's type library (cached)."""
        if self._typelib is None:
            self._typelib = self._request("typelib", {})
            self._classes = {}
            for entry in self._typelib["classes"]:
                members: Dict[str, List[Dict[str, Any]]] = {}
                for member in entry["members"]:
                    members.setdefault(member["name"].lower(), []).append(member)
                self._classes[entry["name"]] = {"entry": entry, "members": members}
        return self._typelib

    def create(self, class_name: str) -> Proxy:
        """Creates an object of a creatable class (or Scripting.Dictionary)."""
        result = self._request("create", {"class": class_name})
        return self._proxy(result["object"], class_name)

    def dictionary(self, mapping: Optional[Mapping[Any, Any]] = None,
                   compare_mode: Optional[int] = None) -> Proxy:
        """A new Scripting.Dictionary, filled from a mapping."""
        proxy = self.create("Scripting.Dictionary")
        if compare_mode is not None:
            proxy.CompareMode = compare_mode
        for key, value in (mapping or {}).items():
            proxy.Add(key, value)
        return proxy

    def invoke(self, obj: Proxy, member: Union[str, int], *args: Any,
               kind: Optional[str] = None) -> Any:
        """Calls a member of an object by name or dispatch id; returns its result."""
        return self.invoke_full(obj, member, *args, kind=kind)[0]

    def invoke_full(self, obj: Proxy, member: Union[str, int], *args: Any,
                    kind: Optional[str] = None) -> Tuple[Any, List[Any]]:
        """Calls a member; returns (result, final values of the arguments passed)."""
        params: Dict[str, Any] = {"object": obj.handle}
        if isinstance(member, int):
            params["dispid"] = member
        else:
            params["member"] = member
        if kind is not None:
            params["kind"] = kind
        params["args"] = [self._encode(arg) for arg in args]
        result = self._request("invoke", params)
        declared = self._declared_member(obj.class_name, member, kind)
        value = self._decode(result["value"], declared and declared.get("returns"))
        if declared is not None and declared.get("returns") is None and value is EMPTY:
            value = None  # a procedure
        params_declared = (declared or {}).get("params", [])
        final = [
            self._decode(arg, params_declared[i]["type"] if i < len(params_declared) else None)
            for i, arg in enumerate(result.get("args", []))
        ]
        return value, final

    def enumerate(self, obj: Proxy) -> List[Any]:
        """What iterating the object yields."""
        items = self._request("enumerate", {"object": obj.handle})["items"]
        return [self._decode(item) for item in items]

    def on(self, obj: Proxy, event_name: str, handler: EventHandler) -> None:
        """Calls ``handler(event)`` when ``obj`` raises ``event_name``; the server raises the
        object's events that have a handler, and no others."""
        key = (obj.handle, event_name.lower())
        subscribed = key in self._handlers
        self._handlers[key] = (handler, obj)
        if not subscribed:
            # The server raises only the events the host handles: for some (the parameter
            # dialog's) the component acts on its own when nobody handles them.
            names = [name for handle, name in self._handlers if handle == obj.handle]
            try:
                self._request("connect", {"object": obj.handle, "events": names})
            except BaseException:
                del self._handlers[key]
                raise

    def disconnect(self, obj: Proxy) -> None:
        """Stops the object's events and forgets its handlers."""
        self._handlers = {k: v for k, v in self._handlers.items() if k[0] != obj.handle}
        self._request("disconnect", {"object": obj.handle})

    def release(self, obj: Proxy) -> None:
        """Gives the object's references back now; the proxy is dead afterwards."""
        refs = obj._refs
        object.__setattr__(obj, "_refs", 0)
        self._proxies.pop(obj.handle, None)
        for _ in range(refs):
            self._request("release", {"object": obj.handle})

    def send_raw(self, line: Union[str, bytes]) -> None:
        """Writes one raw line to the server (for tests of malformed input)."""
        self._input.write(line if isinstance(line, bytes) else line.encode("utf-8"))
        self._input.write(b"\n")
        self._input.flush()

    def read_message(self) -> Dict[str, Any]:
        """Reads one message from the server as it is (for tests)."""
        line = self._output.readline()
        if not line:
            raise ConnectionError("ludmoxd ended")
        return json.loads(line)

    # Internals ----------------------------------------------------------------------

    def _send(self, message):
        text = json.dumps(message, ensure_ascii=True, allow_nan=False, separators=(",", ":"))
        try:
            self._input.write(text.encode("ascii") + b"\n")
            self._input.flush()
        except (BrokenPipeError, ValueError) as error:
            raise ConnectionError("ludmoxd is not running") from error

    def _flush_releases(self):
        while self._releases:
            handle = self._releases.pop()
            self._send({"jsonrpc": "2.0", "method": "release", "params": {"object": handle}})

    def _request(self, method, params):
        if self._closed:
            raise ConnectionError("the client is closed")
        self._flush_releases()
        request_id = self._next_id
        self._next_id += 1
        self._send({"jsonrpc": "2.0", "id": request_id, "method": method, "params": params})
        while request_id not in self._answers:
            message = self.read_message()
            if "method" in message:
                self._serve(message)
            elif message.get("id") is not None:
                self._answers[message["id"]] = message
        answer = self._answers.pop(request_id)
        if "error" in answer:
            raise self._error(answer["error"])
        return answer["result"]

    @staticmethod
    def _error(error):
        data = error.get("data")
        data = data if isinstance(data, dict) else {}
        return ComError(
            data.get("number", error.get("code")), data.get("source", ""),
            data.get("description", error.get("message", "")), error.get("code"), data)

    def _serve(self, message):
        """Answers a request of the server: an event."""
        request_id = message.get("id")
        if message.get("method") != "event":
            if request_id is not None:
                self._send({"jsonrpc": "2.0", "id": request_id, "error": {
                    "code": METHOD_NOT_FOUND, "message": "Method not found"}})
            return
        params = message.get("params", {})
        handle = params.get("object")
        name = params.get("name", "")
        entry = self._handlers.get((handle, name.lower()))
        source = entry[1] if entry else self._proxies.get(handle)
        declared = self._declared_event(source.class_name if source else None, name)
        types = [p["type"] for p in declared["params"]] if declared else []
        args = [self._decode(arg, types[i] if i < len(types) else None)
                for i, arg in enumerate(params.get("args", []))]
        if entry is None:
            answer = {"args": params.get("args", [])}
        else:
            event = Event(source, name, params.get("dispid"), args)
            try:
                returned = entry[0](event)
                final = list(returned) if isinstance(returned, (list, tuple)) else event.args
                answer = {"args": [self._encode(arg) for arg in final]}
            except Exception as error:  # the handler's failure goes back as an error answer
                if request_id is not None:
                    self._send({"jsonrpc": "2.0", "id": request_id, "error": {
                        "code": COMPONENT_ERROR, "message": str(error)}})
                return
        if request_id is not None:
            self._send({"jsonrpc": "2.0", "id": request_id, "result": answer})

    def _forget(self, proxy):
        if proxy._refs and not self._closed:
            self._releases.extend([proxy._handle] * proxy._refs)

    def _proxy(self, handle, class_name=None):
        if handle == 0:
            return NOTHING
        proxy = self._proxies.get(handle)
        if proxy is not None:
            object.__setattr__(proxy, "_refs", proxy._refs + 1)
            if proxy._class is None and class_name:
                object.__setattr__(proxy, "_class", class_name)
            return proxy
        proxy = Proxy(self, handle, class_name)
        self._proxies[handle] = proxy
        return proxy

    def _known_class(self, type_name):
        if not type_name:
            return None
        self.typelib()
        if type_name in self._classes or type_name in _PLATFORM_CLASSES:
            return type_name
        return None

    def _class_members(self, class_name):
        self.typelib()
        if class_name in self._classes:
            return {name: [m["kind"] if m["kind"] != "get" or not _required(m) else "indexed"
                           for m in members]
                    for name, members in self._classes[class_name]["members"].items()}
        if class_name in _PLATFORM_CLASSES:
            return {name: [kind] for name, kind in _PLATFORM_CLASSES[class_name].items()}
        return None

    def _member_kind(self, class_name, name):
        """"method", "property" (read at once), "indexed" (a property read with
        arguments) or None when the host cannot tell (it is then called)."""
        members = self._class_members(class_name)
        kinds = None
        if members is not None:
            kinds = members.get(name.lower())
            if kinds is None:
                raise AttributeError(f"{class_name} has no member {name}")
        else:
            # Unknown class: a name that means the same everywhere in the library decides.
            found = set()
            for other in self._classes:
                kinds_here = self._class_members(other).get(name.lower())
                if kinds_here:
                    found.add(_kind_of(kinds_here))
            if len(found) == 1:
                return found.pop()
            return None
        return _kind_of(kinds)

    def _declared_member(self, class_name, member, kind):
        if not class_name:
            return None
        self.typelib()
        entry = self._classes.get(class_name)
        if entry is None:
            return None
        if isinstance(member, int):
            candidates = [m for m in entry["entry"]["members"] if m["dispid"] == member]
        else:
            candidates = entry["members"].get(member.lower(), [])
        for wanted in ([kind] if kind else ["method", "get"]):
            for candidate in candidates:
                if candidate["kind"] == wanted:
                    return candidate
        return candidates[0] if candidates else None

    def _declared_event(self, class_name, name):
        if not class_name:
            return None
        self.typelib()
        entry = self._classes.get(class_name)
        events = entry and entry["entry"].get("events")
        for event in (events or {}).get("members", []):
            if event["name"].lower() == name.lower():
                return event
        return None

    def _call_default(self, proxy, kind, args):
        return self.invoke(proxy, 0, *args, kind=kind)

    def _encode(self, value):
        if value is None:
            return None
        if value is EMPTY:
            return {"$empty": True}
        if value is NOTHING:
            return {"$object": 0}
        if value is MISSING:
            return {"$missing": True}
        if isinstance(value, Proxy):
            return {"$object": value.handle}
        if isinstance(value, ErrorValue):
            return {"$error": value.code}
        if isinstance(value, (bool, int, float, str)):
            return value
        if isinstance(value, decimal.Decimal):
            return {"$currency": format(value, "f")}
        if isinstance(value, datetime.datetime):
            if value.tzinfo is not None:
                value = value.astimezone().replace(tzinfo=None)
            precision = "milliseconds" if value.microsecond else "seconds"
            return {"$date": value.isoformat(timespec=precision)}
        if isinstance(value, datetime.date):
            return {"$date": value.isoformat()}
        if isinstance(value, Array2D):
            return {"$array": [[self._encode(v) for v in row] for row in value],
                    "bounds": [list(pair) for pair in value.bounds]}
        if isinstance(value, (list, tuple)):
            return {"$array": [self._encode(v) for v in value],
                    "lbound": getattr(value, "lbound", 0)}
        if isinstance(value, (bytes, bytearray)):
            return {"$array": list(value), "lbound": 0}
        raise TypeError(f"cannot pass {type(value).__name__} to the component")

    def _decode(self, value, type_name=None):
        if isinstance(value, list):
            return [self._decode(v) for v in value]
        if not isinstance(value, dict):
            return value
        if "$empty" in value:
            return EMPTY
        if "$missing" in value:
            return MISSING
        if "$object" in value:
            return self._proxy(value["$object"], self._known_class(type_name))
        if "$currency" in value:
            return decimal.Decimal(value["$currency"])
        if "$date" in value:
            return datetime.datetime.fromisoformat(value["$date"])
        if "$error" in value:
            return ErrorValue(value["$error"])
        if "$array" in value:
            if "bounds" in value:
                return Array2D([[self._decode(v) for v in row] for row in value["$array"]],
                               value["bounds"])
            items = [self._decode(v) for v in value["$array"]]
            lbound = value.get("lbound", 0)
            return items if lbound == 0 else Array(items, lbound)
        return value


def _required(member):
    return any(not p["optional"] for p in member["params"])


def _kind_of(kinds):
    if "method" in kinds:
        return "method"
    if "indexed" in kinds:
        return "indexed"
    if "get" in kinds:
        return "property"
    return "method"
