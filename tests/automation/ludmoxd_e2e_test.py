"""Drives ludmoxd from Python as a host does: by member name, through the host library.

Run by CTest with LUDMOX_LUDMOXD set to the server and PYTHONPATH to python/.
"""

import datetime
import decimal
import gc
import json
import os
import sqlite3
import subprocess
import tempfile
import unittest

from ludmox import (
    EMPTY, MISSING, NOTHING, Array, Array2D, Client, ComError, Proxy,
)

MEMBER_NOT_FOUND = -2147352573  # 0x80020003
TYPE_MISMATCH = -2147352571  # 0x80020005
BAD_PARAM_COUNT = -2147352562  # 0x8002000E
PARAM_NOT_OPTIONAL = -2147352561  # 0x8002000F
OBJECT_VARIABLE_NOT_SET = 91
OPEN_REPORT_FAILED = -2147191159  # 0x80047689


def start(diagnostics=False):
    """A server; with diagnostics its standard error is kept for reading after close."""
    return Client(stderr=subprocess.PIPE if diagnostics else subprocess.DEVNULL)


def diagnostics_of(mox):
    text = mox.process.stderr.read().decode()
    mox.process.stderr.close()
    return text


class TypeLibraryTest(unittest.TestCase):
    def setUp(self):
        self.mox = start()
        self.addCleanup(self.mox.close)
        self.library = self.mox.typelib()
        self.classes = {c["name"]: c for c in self.library["classes"]}

    def dispid(self, class_name, member, kind):
        for entry in self.classes[class_name]["members"]:
            if entry["name"] == member and entry["kind"] == kind:
                return entry["dispid"]
        self.fail(f"{class_name}.{member} ({kind}) is not listed")

    def test_names_the_library(self):
        self.assertEqual(self.library["name"], "LUDMoxViewer115")
        self.assertEqual(self.library["version"], "1.0")

    def test_lists_the_foundation_classes(self):
        for name in ("MoxEngine115", "MoxReports115", "MoxStatus115", "MoxEvents115",
                     "MoxReport115"):
            self.assertIn(name, self.classes)
        creatable = {name for name, entry in self.classes.items() if entry["creatable"]}
        self.assertIn("MoxEngine115", creatable)
        # Only the engine and the viewer classes may be created by hosts.
        self.assertLessEqual(creatable, {"MoxEngine115", "clsMoxViewer115", "IMoxViewer115"})

    def test_dispatch_ids_are_those_of_the_interfaces(self):
        cases = [
            ("MoxEngine115", "Init", "method", 0x60030008),
            ("MoxEngine115", "MainWindowHandle", "put", 0x68030007),
            ("MoxEngine115", "ConnectionFailed", "get", 0x68030005),
            ("MoxEngine115", "ConnectionFailed", "put", 0x68030005),
            ("MoxEngine115", "GetReports", "method", 0x6003000A),
            ("MoxEngine115", "Logoff", "method", 0x60030014),
            ("MoxEngine115", "CanUnload", "method", 0x60030015),
            ("MoxReports115", "Item", "method", 0),
            ("MoxReports115", "NewEnum", "get", -4),
        ]
        for class_name, member, kind, dispid in cases:
            with self.subTest(member=member, kind=kind):
                self.assertEqual(self.dispid(class_name, member, kind), dispid)

    def test_members_carry_types_optional_and_by_reference(self):
        init = next(m for m in self.classes["MoxEngine115"]["members"] if m["name"] == "Init")
        self.assertEqual(init["params"][0],
                         {"name": "Language", "type": "Integer", "optional": False,
                          "byref": True})
        self.assertIsNone(init["returns"])
        setup = next(m for m in self.classes["MoxEngine115"]["members"]
                     if m["name"] == "PrinterSetup")
        self.assertEqual([p["optional"] for p in setup["params"]], [True, True, True])
        self.assertEqual(setup["params"][1]["default"], 0)
        logon = next(m for m in self.classes["MoxEngine115"]["members"]
                     if m["name"] == "SetLogonInfo")
        self.assertEqual(logon["params"][0]["type"], "MoxServerTypes")
        enumerator = next(m for m in self.classes["MoxReports115"]["members"]
                          if m["dispid"] == -4)
        self.assertTrue(enumerator.get("hidden"))

    def test_event_interface(self):
        events = self.classes["MoxEvents115"]["events"]
        self.assertEqual(events["interface"], "__MoxEvents115")
        by_name = {e["name"]: e for e in events["members"]}
        self.assertEqual(by_name["QueryParameters"]["dispid"], 1)
        self.assertEqual(by_name["ErrorOccured"]["dispid"], 2)
        self.assertEqual(by_name["ShowParametersDialogEvent"]["dispid"], 3)
        self.assertEqual(by_name["AfterDialogs"]["dispid"], 4)
        self.assertTrue(all(p["byref"] for p in by_name["QueryParameters"]["params"]))
        self.assertIsNone(self.classes["MoxEngine115"]["events"])

    def test_enumerations(self):
        enums = {e["name"]: e["members"] for e in self.library["enums"]}
        self.assertEqual(enums["enuPrintProgress"], {
            "eppNoReport": 0, "eppPrintingNotStarted": 1, "eppPrintingInProgress": 2,
            "eppPrintingCompleted": 3, "eppPrintingFailed": 4, "eppPrintingCancelled": 5,
            "eppPrintingHalted": 6})
        self.assertEqual(enums["MoxServerTypes"],
                         {"ecstNone": 0, "ecstMSJET": 1, "ecstMSSQL": 2, "ecstMSJET40": 3})


class HostSessionTest(unittest.TestCase):
    def setUp(self):
        self.mox = start()
        self.addCleanup(self.mox.close)
        self.engine = self.mox.create("MoxEngine115")

    def test_logon_data_and_properties(self):
        self.assertIsNone(self.engine.Init(3, True, 0xFFFFFF, 0))
        self.assertIs(self.engine.SetLogonInfo(2, "server", "database", "user", "secret"), True)
        self.assertEqual(self.engine.LastError, "")
        self.assertIs(self.engine.ConnectionFailed, False)
        self.engine.ConnectionFailed = True
        self.assertIs(self.engine.ConnectionFailed, True)
        self.engine.MainWindowHandle = 4711
        self.assertEqual(self.engine.Properties("MDIHandle"), 4711)
        self.engine.SetDialogParentWindow(17)
        self.assertEqual(self.engine.Properties("DialogParentHwnd"), 17)
        self.assertIs(self.engine.Properties("NoSuchKey"), EMPTY)
        # The enumeration value by number, as hosts pass it; a string that reads as a
        # number converts like any Basic argument.
        self.assertIs(self.engine.SetLogonInfo("1", "c:/data.mdb", "", "", ""), True)

    def test_collections_and_reports(self):
        reports = self.engine.GetReports()
        self.assertEqual(reports.class_name, "MoxReports115")
        other = self.engine.GetReports()
        self.assertIsNot(reports, other)

        report = reports.Item("/reports/Orders.rpt")
        self.assertEqual(report.class_name, "MoxReport115")
        # The same object always comes back under the same handle, whatever the case.
        self.assertIs(reports.Item("/REPORTS/orders.RPT"), report)
        self.assertIs(reports["/reports/orders.rpt"], report)
        self.assertIsNot(other.Item("/reports/Orders.rpt"), report)
        second = reports.Item("/reports/Invoices.rpt")
        self.assertEqual(list(reports), [report, second])

        report.DefaultPrinter = "PDF"
        self.assertEqual(report.DefaultPrinter, "PDF")
        report.TopNGroups = 5
        self.assertEqual(report.TopNGroups, 5)
        status = report.Status
        self.assertEqual(status.class_name, "MoxStatus115")
        self.assertEqual(status.Progress, 0)
        status.NumberOfPages = 12
        self.assertEqual(status.NumberOfPages, 12)
        self.assertIs(report.MoxEvents, report.MoxEvents)

        reports.Remove("/reports/Invoices.rpt")
        self.assertEqual(list(reports), [report])
        reports.Destroy()
        self.assertIs(reports.Item("/reports/Orders.rpt"), NOTHING)
        with self.assertRaises(ComError) as caught:
            list(reports)
        self.assertEqual(caught.exception.number, OBJECT_VARIABLE_NOT_SET)
        self.assertEqual(caught.exception.code, -32000)

    def test_by_reference_and_optional_arguments(self):
        report = self.engine.GetReports().Item("/reports/a.rpt")
        result, args = report.invoke_full("CloseReport", True)
        self.assertIs(result, True)
        self.assertEqual(args, [True])
        self.assertIs(report.CloseReport(), True)
        # An optional argument left out, or skipped with MISSING, takes its default.
        self.assertIs(report.SetSelection("Orders", [1, 2, 3]), True)
        result, args = report.invoke_full("SetSelection", "Orders", 5, MISSING)
        self.assertIs(result, True)
        self.assertEqual(args, ["Orders", 5, MISSING])

    def test_call_errors(self):
        cases = [
            ("unknown member", lambda: self.engine.invoke("NoSuchMember"), MEMBER_NOT_FOUND),
            ("too many", lambda: self.engine.Logoff(1), BAD_PARAM_COUNT),
            ("too few", lambda: self.engine.Init(3), PARAM_NOT_OPTIONAL),
            ("skipped required", lambda: self.engine.Init(3, MISSING, 0, 0), PARAM_NOT_OPTIONAL),
            ("no conversion", lambda: self.engine.Init("three", True, 0, 0), TYPE_MISMATCH),
            ("object for text", lambda: self.engine.Properties(self.engine), TYPE_MISMATCH),
            ("read-only", lambda: self.engine.invoke("LastError", "x", kind="put"),
             MEMBER_NOT_FOUND),
        ]
        for name, call, number in cases:
            with self.subTest(name):
                with self.assertRaises(ComError) as caught:
                    call()
                self.assertEqual(caught.exception.number, number)
                self.assertEqual(caught.exception.code, -32602)
        # The server keeps serving.
        self.assertIs(self.engine.CanUnload() in (True, False), True)

    def test_unknown_class_and_handle(self):
        with self.assertRaises(ComError) as caught:
            self.mox.create("MoxReports115")
        self.assertEqual(caught.exception.code, -32602)
        dictionary = self.mox.create("Scripting.Dictionary")
        self.mox.release(dictionary)
        with self.assertRaises(ComError) as caught:
            self.mox.invoke(dictionary, "Count")
        self.assertEqual(caught.exception.code, -32602)


class ValuesTest(unittest.TestCase):
    """Every value form travels to the component and back unchanged."""

    def setUp(self):
        self.mox = start()
        self.addCleanup(self.mox.close)
        self.dictionary = self.mox.create("Scripting.Dictionary")

    def round_trip(self, value):
        self.dictionary.Add("key", value)
        back = self.dictionary.Item("key")
        self.dictionary.Remove("key")
        return back

    def test_round_trips(self):
        cases = [
            None, EMPTY, True, False, 0, -2147483648, 2.5, 2.0, "Tere, \u20ac \U0001F600",
            "",
            decimal.Decimal("12.3400"), decimal.Decimal("-0.0001"),
            datetime.datetime(2026, 12, 6, 14, 30), datetime.datetime(1899, 12, 29, 6, 0),
            datetime.datetime(2026, 1, 1, 0, 0, 0, 500000),
            ["a", 1, None], Array(["x", "y"], lbound=1),
            Array2D([[1, 2, 3], [4, 5, 6]], bounds=((1, 2), (0, 2))),
            [[1, 2], [EMPTY]],
        ]
        for value in cases:
            with self.subTest(value=value):
                back = self.round_trip(value)
                self.assertEqual(back, value)
                self.assertIs(type(back), type(value))

    def test_objects_travel_as_the_same_proxy(self):
        engine = self.mox.create("MoxEngine115")
        self.assertIs(self.round_trip(engine), engine)
        self.assertIs(self.round_trip(NOTHING), NOTHING)

    def test_dictionary_members(self):
        d = self.mox.dictionary({"a": 1, "b": 2})
        self.assertEqual(len(d), 2)
        self.assertEqual(list(d), ["a", "b"])
        self.assertEqual(d.Keys(), ["a", "b"])
        self.assertEqual(d.Items(), [1, 2])
        d["c"] = 3
        self.assertEqual(d["c"], 3)
        self.assertIs(d.Exists("A"), False)
        with self.assertRaises(ComError) as caught:
            d.Add("a", 0)
        self.assertEqual(caught.exception.number, 457)
        folded = self.mox.dictionary({"Key": 1}, compare_mode=1)
        self.assertIs(folded.Exists("KEY"), True)
        self.assertEqual(folded.CompareMode, 1)


class EventsTest(unittest.TestCase):
    def setUp(self):
        self.mox = start()
        self.addCleanup(self.mox.close)
        self.engine = self.mox.create("MoxEngine115")
        self.report = self.engine.GetReports().Item("/reports/a.rpt")
        self.events = self.report.MoxEvents

    def test_without_a_handler_arguments_come_back_unchanged(self):
        _, args = self.events.invoke_full("QueryParameters", "LUD#Customer", EMPTY)
        self.assertEqual(args, ["LUD#Customer", EMPTY])

    def test_handler_changes_by_reference_arguments_and_calls_back(self):
        seen = []

        def on_error(event):
            seen.append(("ErrorOccured", event.args[0]))

        def on_query(event):
            seen.append(("QueryParameters", list(event.args)))
            # Calls back into the component from inside the handler; one of them raises a
            # nested event to this host.
            self.report.DefaultPrinter = "Inner"
            self.events.ErrorOccured("from inside")
            event.args[0] = "Changed"
            event.args[1] = [1, 2, 3]

        self.mox.on(self.events, "QueryParameters", on_query)
        self.mox.on(self.events, "ErrorOccured", on_error)
        result, args = self.events.invoke_full("QueryParameters", "LUD#Customer", EMPTY)
        self.assertIsNone(result, "a procedure")
        self.assertEqual(args, ["Changed", [1, 2, 3]])
        self.assertEqual(seen, [("QueryParameters", ["LUD#Customer", EMPTY]),
                                ("ErrorOccured", "from inside")])
        self.assertEqual(self.report.DefaultPrinter, "Inner")

        # The event's other by-reference argument: Cancelled of the dialog event.
        self.mox.on(self.events, "ShowParametersDialogEvent",
                    lambda event: event.args.__setitem__(1, True))
        _, args = self.events.invoke_full("ShowParametersDialog", self.engine, False)
        self.assertEqual(args, [self.engine, True])

        self.mox.disconnect(self.events)
        _, args = self.events.invoke_full("QueryParameters", "LUD#Customer", EMPTY)
        self.assertEqual(args, ["LUD#Customer", EMPTY])

    def test_only_the_events_a_host_names_are_raised_to_it(self):
        def call(request_id, method, params):
            self.mox.send_raw(json.dumps(
                {"jsonrpc": "2.0", "id": request_id, "method": method, "params": params}))

        def invoke(request_id, member, args):
            call(request_id, "invoke",
                 {"object": self.events.handle, "member": member, "args": args})

        call(900, "connect", {"object": self.events.handle, "events": ["errorOCCURED"]})
        self.assertEqual(self.mox.read_message()["id"], 900)
        # Not named: answered at once, without an event to the host first.
        invoke(901, "QueryParameters", ["LUD#X", {"$empty": True}])
        self.assertEqual(self.mox.read_message()["id"], 901)
        invoke(902, "ErrorOccured", ["named"])
        event = self.mox.read_message()
        self.assertEqual((event["method"], event["params"]["name"]), ("event", "ErrorOccured"))
        self.mox.send_raw(json.dumps({"jsonrpc": "2.0", "id": event["id"], "result": {}}))
        self.assertEqual(self.mox.read_message()["id"], 902)

        for events in (["NoSuchEvent"], "ErrorOccured", [7]):
            with self.subTest(events=events):
                call(903, "connect", {"object": self.events.handle, "events": events})
                self.assertEqual(self.mox.read_message()["error"]["code"], -32602)
        # A refused list leaves the subscription as it was.
        invoke(904, "ErrorOccured", ["still"])
        event = self.mox.read_message()
        self.assertEqual(event["method"], "event")
        self.mox.send_raw(json.dumps({"jsonrpc": "2.0", "id": event["id"], "result": {}}))
        self.assertEqual(self.mox.read_message()["id"], 904)

    def test_a_failing_handler_leaves_arguments_unchanged(self):
        def broken(event):
            event.args[0] = "half done"
            raise RuntimeError("handler failed")

        self.mox.on(self.events, "QueryParameters", broken)
        _, args = self.events.invoke_full("QueryParameters", "LUD#X", EMPTY)
        self.assertEqual(args, ["LUD#X", EMPTY])


class RuntimeReportTest(unittest.TestCase):
    """The runtime's own report object, handed out by C_Report, is reached by member name."""

    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.database = os.path.join(folder.name, "shop.db")
        with sqlite3.connect(self.database) as connection:
            connection.execute("CREATE TABLE Orders (ID INTEGER, Customer TEXT)")
            connection.executemany("INSERT INTO Orders VALUES (?, ?)", [(1, "A"), (2, "B")])
        connection.close()
        self.path = os.path.join(folder.name, "orders.rpt")
        with open(self.path, "w", encoding="utf-8") as document:
            json.dump({
                "format": "ludmox-report", "version": 1,
                "tables": [{
                    "name": "Orders",
                    "connection": [{"name": "Provider", "value": "Microsoft.Jet.OLEDB.4.0"},
                                   {"name": "Data Source", "value": self.database}],
                    "fields": [{"name": "ID", "type": "number"},
                               {"name": "Customer", "type": "string"}]}],
                "selectionFormula": "{Orders.ID} > 0"}, document)
        self.mox = start()
        self.addCleanup(self.mox.close)
        self.engine = self.mox.create("MoxEngine115")
        self.engine.SetLogonInfo(1, self.database, "", "", "")
        # The host keeps the collection: a report reaches its engine through it.
        self.reports = self.engine.GetReports()

    def test_selection_formula_and_statement_by_name(self):
        runtime_report = self.reports.Item(self.path).C_Report
        self.assertIsInstance(runtime_report, Proxy)
        self.assertEqual(runtime_report.RecordSelectionFormula(), "{Orders.ID} > 0")
        self.assertIn("FROM Orders", runtime_report.SQLQueryString())
        runtime_report.RecordSelectionFormula = "{Orders.ID} = 2"
        self.assertEqual(runtime_report.RecordSelectionFormula(), "{Orders.ID} = 2")

    def test_runtime_errors_reach_the_host(self):
        report = self.reports.Item(os.path.join(os.path.dirname(self.path), "absent.rpt"))
        with self.assertRaises(ComError) as caught:
            report.C_Report
        error = caught.exception
        self.assertEqual((error.code, error.number), (-32000, OPEN_REPORT_FAILED))
        self.assertTrue(error.source)
        self.assertIn("absent.rpt", error.description)


class ServerLifetimeTest(unittest.TestCase):
    def test_malformed_lines_are_answered_and_serving_goes_on(self):
        with start() as mox:
            for line, code in ((b"not json", -32700), (b"{\"id\": 1", -32700),
                               (b"[]", -32600), (b"\xff\xfe", -32700)):
                with self.subTest(line=line):
                    mox.send_raw(line)
                    answer = mox.read_message()
                    self.assertIsNone(answer["id"])
                    self.assertEqual(answer["error"]["code"], code)
            mox.send_raw(b'{"jsonrpc":"2.0","id":99,"method":"frobnicate"}')
            self.assertEqual(mox.read_message()["error"]["code"], -32601)
            engine = mox.create("MoxEngine115")
            self.assertIs(engine.SetLogonInfo(2, "s", "d", "u", "p"), True)

    def test_end_of_input_ends_the_server_and_releases_everything(self):
        mox = start(diagnostics=True)
        engine = mox.create("MoxEngine115")
        reports = engine.GetReports()
        reports.Item("/r.rpt")
        self.assertEqual(mox.close(), 0)
        self.assertIn("released 3 objects", diagnostics_of(mox))

    def test_dialogs_left_open_by_a_departed_host_are_cancelled(self):
        # The print dialog is modal and nobody answers it offscreen; once the host closes
        # the server's input the dialog is cancelled and the call returns False. The
        # second call opens its dialog only after the input has ended.
        mox = start()
        engine = mox.create("MoxEngine115")
        for request_id in (100, 101):
            mox.send_raw(json.dumps({"jsonrpc": "2.0", "id": request_id, "method": "invoke",
                                     "params": {"object": engine.handle,
                                                "member": "PrinterSetup"}}))
        mox.process.stdin.close()
        answers = [mox.read_message(), mox.read_message()]
        self.assertEqual([a["result"]["value"] for a in answers], [False, False])
        self.assertEqual(mox.process.wait(timeout=120), 0)
        mox.process.stdout.close()

    def test_proxies_give_their_references_back(self):
        mox = start(diagnostics=True)
        engine = mox.create("MoxEngine115")
        for _ in range(3):
            engine.GetReports()
        dictionary = mox.create("Scripting.Dictionary")
        del dictionary
        gc.collect()
        engine.Init(3, False, 0, 0)  # the next call sends the releases first
        del engine
        gc.collect()
        # shutdown sends the last releases before it asks the server to end.
        self.assertEqual(mox.shutdown(), 0)
        self.assertIn("released 0 objects", diagnostics_of(mox))


if __name__ == "__main__":
    unittest.main()
