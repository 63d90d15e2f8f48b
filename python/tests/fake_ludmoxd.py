"""A stand-in for ludmoxd that speaks its protocol over standard input and output.

It serves one creatable class, ``Widget``, whose members make the server do what the
client must cope with: fail, refuse a call, hand out the same object again, raise an event
and wait for the answer while serving the host's calls, ask the host something it does not
serve, or end without answering. ``Received`` gives back every line read so far, as read.
"""

import json
import sys

COMPONENT_ERROR = -32000
METHOD_NOT_FOUND = -32601
INVALID_PARAMS = -32602
MEMBER_NOT_FOUND = -2147352573  # 0x80020003
TYPE_MISMATCH = -2147352571  # 0x80020005
OPEN_REPORT_FAILED = -2147191159  # 0x80047689


def param(name, type_name="Variant", byref=True, optional=False):
    return {"name": name, "type": type_name, "optional": optional, "byref": byref}


def member(name, dispid, kind="method", params=(), returns="Variant"):
    return {"name": name, "dispid": dispid, "kind": kind, "params": list(params),
            "returns": returns}


TYPELIB = {
    "name": "LUDMoxViewer115", "version": "1.0",
    "classes": [{
        "name": "Widget", "creatable": True, "interface": "_Widget",
        "events": {"name": "__Widget", "members": [
            member("Changed", 1, params=[param("Value"), param("Sender", "Widget")],
                   returns=None),
        ]},
        "members": [
            member("Name", 1, "get", returns="String"),
            member("Name", 1, "put", [param("Name", "String", byref=False)], None),
            member("Same", 2, returns="Widget"),
            member("Other", 3, returns="Widget"),
            member("Fail", 4),
            member("Typed", 5, params=[param("Count", "Long", byref=False)]),
            member("Swap", 6, params=[param("First"), param("Second")], returns=None),
            member("Fire", 7, params=[param("Value")]),
            member("Ask", 8),
            member("Refs", 9, params=[param("Handle", "Long", byref=False)]),
            member("Received", 10),
            member("Die", 11),
        ],
    }],
    "enums": [],
}


class Server:
    def __init__(self):
        self.received = []
        self.refs = {}
        self.next_handle = 1
        self.next_request = 1
        self.connected = {}

    def send(self, message):
        # Raw UTF-8, as the real server writes it: the client must not need ASCII.
        sys.stdout.write(json.dumps(message, ensure_ascii=False) + "\n")
        sys.stdout.flush()

    def read(self):
        # Bytes as they came, so that a stray line break or non-ASCII byte shows.
        raw = sys.stdin.buffer.readline()
        if not raw:
            sys.exit(0)
        line = raw.decode("utf-8")
        self.received.append(line)
        return json.loads(line)

    def hand_out(self, handle):
        self.refs[handle] = self.refs.get(handle, 0) + 1
        return {"$object": handle}

    def new_object(self):
        handle = self.next_handle
        self.next_handle += 1
        return self.hand_out(handle)

    def run(self):
        while True:
            self.serve(self.read())

    def request_host(self, method, params):
        """Sends a request to the host and serves the host's calls until it answers."""
        request_id = f"s{self.next_request}"
        self.next_request += 1
        self.send({"jsonrpc": "2.0", "id": request_id, "method": method, "params": params})
        while True:
            message = self.read()
            if "method" in message:
                self.serve(message)
            elif message.get("id") == request_id:
                return message

    def serve(self, message):
        request_id = message.get("id")
        try:
            result = self.call(message["method"], message.get("params", {}))
        except RpcError as error:
            if request_id is not None:
                self.send({"jsonrpc": "2.0", "id": request_id, "error": error.answer})
            return
        if request_id is not None:
            self.send({"jsonrpc": "2.0", "id": request_id, "result": result})

    def call(self, method, params):
        if method == "typelib":
            return TYPELIB
        if method == "create":
            if params.get("class") != "Widget":
                raise RpcError(INVALID_PARAMS, "Invalid params",
                               {"number": MEMBER_NOT_FOUND, "source": "ludmoxd",
                                "description": "Unknown class"})
            return {"object": self.new_object()["$object"]}
        if method == "release":
            self.refs[params["object"]] -= 1
            return {}
        if method == "connect":
            self.connected[params["object"]] = params.get("events")
            return {}
        if method == "disconnect":
            self.connected.pop(params["object"], None)
            return {}
        if method == "shutdown":
            return {}
        if method == "invoke":
            return self.invoke(params)
        raise RpcError(METHOD_NOT_FOUND, "Method not found")

    def invoke(self, params):
        handle = params["object"]
        name = params.get("member", "").lower()
        args = params.get("args", [])
        if self.refs.get(handle, 0) <= 0:
            raise RpcError(INVALID_PARAMS, "Invalid params",
                           {"number": -2147418113, "source": "ludmoxd",
                            "description": f"Unknown object {handle}"})
        value = {"$empty": True}
        if name == "name":
            value = "Grüße\u2028zwei" if params.get("kind") != "put" else {"$empty": True}
        elif name == "same":
            value = self.hand_out(handle)
        elif name == "other":
            value = self.new_object()
        elif name == "fail":
            raise RpcError(COMPONENT_ERROR, "Component error",
                           {"number": OPEN_REPORT_FAILED, "source": "Widget.Fail",
                            "description": "Cannot open the report file."})
        elif name == "typed":
            if not isinstance(args[0], int):
                raise RpcError(INVALID_PARAMS, "Invalid params",
                               {"number": TYPE_MISMATCH, "source": "ludmoxd",
                                "description": "Type mismatch", "argument": 0})
        elif name == "swap":
            args = [args[1], args[0]]
        elif name == "fire":
            if "changed" not in (self.connected.get(handle) or []):
                value = "not connected"
            else:
                answer = self.request_host("event", {
                    "object": handle, "name": "Changed", "dispid": 1,
                    "args": [args[0], self.hand_out(handle)]})
                value = json.dumps(answer)
        elif name == "ask":
            value = json.dumps(self.request_host("ping", {}))
        elif name == "refs":
            value = self.refs.get(args[0], 0)
        elif name == "received":
            value = json.dumps(self.received)
        elif name == "die":
            sys.exit(3)
        else:
            raise RpcError(INVALID_PARAMS, "Invalid params",
                           {"number": MEMBER_NOT_FOUND, "source": "ludmoxd",
                            "description": "Unknown name"})
        return {"value": value, "args": args}


class RpcError(Exception):
    def __init__(self, code, message, data=None):
        super().__init__(message)
        self.answer = {"code": code, "message": message}
        if data is not None:
            self.answer["data"] = data


if __name__ == "__main__":
    sys.stdout.reconfigure(encoding="utf-8")
    Server().run()
