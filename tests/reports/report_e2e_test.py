"""A host drives a report through ludmoxd and the real report runtime: it sets a selection,
answers QueryParameters, and reads the resulting selection formula and SQL statement back
from the runtime's report object (C_Report).

Run by CTest with LUDMOX_LUDMOXD set to the server and PYTHONPATH to python/.
"""

import json
import os
import re
import sqlite3
import subprocess
import tempfile
import threading
import unittest

from ludmox import Array2D, Client, ComError

ECST_MSJET = 1
USER_CANCELLED = -2147221351  # 0x80040099
SUBSCRIPT_OUT_OF_RANGE = 9
CRLF = "\r\n"


def make_database(path):
    with sqlite3.connect(path) as db:
        db.execute("CREATE TABLE Orders (ID INTEGER PRIMARY KEY, Status TEXT, Total REAL)")
        db.executemany("INSERT INTO Orders VALUES (?, ?, ?)",
                       [(1, "open", 50), (3, "open", 150), (5, "closed", 500)])


def report_document(selection_formula):
    return {
        "format": "ludmox-report",
        "version": 1,
        "tables": [{
            "name": "Orders",
            "location": "shop.dbo.Orders",
            "driver": "crdb_ado.dll",
            "connection": [
                {"name": "Provider", "value": "SQLOLEDB"},
                {"name": "Data Source", "value": "designsrv"},
                {"name": "Initial Catalog", "value": "shop"},
            ],
            "fields": [
                {"name": "ID", "type": "number"},
                {"name": "Status", "type": "string"},
                {"name": "Total", "type": "number"},
            ],
        }],
        "selectionFormula": selection_formula,
        # Offered values come from the host; the report does not use the parameter, so it
        # needs no value and no dialog is shown.
        "parameters": [{"name": "Region", "prompt": "LUD#Regions", "valueType": 12}],
        "sections": [{
            "name": "D", "height": 300,
            "objects": [{"kind": "field", "name": "IDField", "field": "{Orders.ID}",
                         "width": 1000, "height": 240}],
        }],
    }


class ReportThroughLudmoxd(unittest.TestCase):
    def setUp(self):
        self.folder = tempfile.TemporaryDirectory()
        self.addCleanup(self.folder.cleanup)
        self.database = os.path.join(self.folder.name, "shop.db")
        make_database(self.database)
        self.mox = Client(stderr=subprocess.DEVNULL)
        self.addCleanup(self.mox.close)
        self.engine = self.mox.create("MoxEngine115")
        self.engine.Init(3, False, 0, 0)
        # A Jet logon names the database file as the server.
        self.engine.SetLogonInfo(ECST_MSJET, self.database, "", "admin", "")
        self.reports = self.engine.GetReports()

    def open_report(self, name, selection_formula):
        path = os.path.join(self.folder.name, name)
        with open(path, "w", encoding="utf-8") as file:
            json.dump(report_document(selection_formula), file)
        return self.reports.Item(path)

    def test_a_selection_and_the_hosts_answer_reach_the_runtime_report(self):
        report = self.open_report("orders.rpt", "{Orders.Status} = 'open'")
        events = report.MoxEvents
        prompts = []

        def answer(event):
            prompts.append(event.args[0])
            event.args[1] = Array2D([["N", "S", "unused"], ["North", "South", ""]])

        self.mox.on(events, "QueryParameters", answer)
        self.assertTrue(report.SetSelection("Orders", 5))

        # The runtime's own report object, reached by member name as a late-bound host does.
        runtime_report = report.C_Report
        self.assertEqual(prompts, ["LUD#Regions"])
        self.assertFalse(report.UnloadRequest)
        self.assertEqual(
            runtime_report.RecordSelectionFormula.get(),
            CRLF.join(["(//LUD#1", "{Orders.Status} = 'open'", ")//LUD#2", "//LUDSELECTION",
                       "AND ({Orders.ID}=5)"]))

        # A list of ids goes into the statement, after the runtime's own condition.
        self.assertTrue(report.SetSelection("Orders", [1, 3]))
        self.assertEqual(runtime_report.RecordSelectionFormula.get(), "{Orders.Status} = 'open'")
        statement = runtime_report.SQLQueryString.get()
        head, where, condition = statement.rpartition(CRLF + "WHERE" + CRLF + "    ")
        self.assertTrue(where, statement)
        self.assertTrue(condition.endswith("(Orders.ID IN (1,3))"), statement)
        self.assertNotIn('"', statement, "Jet statements quote with grave accents")

        # The host is asked once per report; a second run keeps what it answered.
        self.assertIsNone(report.SetParameters())
        self.assertEqual(prompts, ["LUD#Regions"])

    def test_an_answer_the_component_cannot_read_reaches_the_host_as_an_error(self):
        report = self.open_report("orders.rpt", "")
        # Offered values need two rows (values and descriptions); one row has no second
        # dimension to read.
        self.mox.on(report.MoxEvents, "QueryParameters",
                    lambda event: event.args.__setitem__(1, ["N", "S"]))
        with self.assertRaises(ComError) as raised:
            report.C_Report
        self.assertEqual(raised.exception.number, SUBSCRIPT_OUT_OF_RANGE)
        self.assertTrue(report.UnloadRequest)

    def test_the_editing_cycle_and_the_other_members_by_name(self):
        report = self.open_report("orders.rpt", "{Orders.Status} = 'open'")
        self.assertTrue(report.SetSelection("Orders", 5))
        self.assertEqual(report.Status.Progress, 0)
        self.assertTrue(report.CheckOLEDB())
        report.C_Report  # loads: saving for editing needs the applied selection
        scratch = os.path.join(self.folder.name, "scratch.rpt")
        self.assertTrue(report.SaveReport(scratch))

        ok, (_, original, saved, edited) = report.CheckEditedSelection.full(scratch, "", "", "")
        self.assertTrue(ok)
        self.assertEqual(original, "{Orders.Status} = 'open'")
        self.assertTrue(saved.endswith("AND ({Orders.ID}=5)"))
        self.assertEqual(edited, "{Orders.Status} = 'open'")
        self.assertTrue(report.ReplaceEdited(scratch, "{Orders.Total} > 100"))
        self.assertTrue(report.C_Report.RecordSelectionFormula.get().startswith(
            "(//LUD#1" + CRLF + "{Orders.Total} > 100" + CRLF))

        self.assertEqual(list(report.GetParamsCollection()), [["Region", "LUD#Regions"]])
        self.assertEqual(report.GetParamsDictionary().Item("0"), ["Region", "LUD#Regions"])
        self.assertEqual(report.TopNGroups, -1)
        report.IgnoreNoDataCheck = True
        report.UseOldCrystal = True
        self.assertFalse(report.SaveReport(scratch))
        self.assertEqual((report.SendMailError, report.SaveAsPDFError, report.SaveAsXLSError),
                         (False, False, False))
        self.assertTrue(report.CloseReport(True))
        self.assertIsNone(report.CloseReport8())
        self.assertEqual(report.Status.Progress, 0)

    def export_records(self, path, status):
        """Exports a saved report with the command-line host and a value for S; the number
        of records it printed."""
        output = os.path.join(self.folder.name, "out")
        done = subprocess.run(
            [os.environ["LUDMOX_CLI"], "export", "--database", self.database, "--output", output,
             "--param", "S=" + status, path],
            capture_output=True, text=True, timeout=120, check=False)
        self.assertEqual(done.returncode, 0, done.stderr)
        match = re.search(r": (\d+) records,", done.stdout)
        self.assertTrue(match, done.stdout)
        return int(match.group(1))

    def test_a_changed_parameter_reaches_every_statement_and_the_saved_report(self):
        document = report_document("{Orders.Status} = {?S}")
        document["parameters"] = [{"name": "S", "valueType": 12}]
        path = os.path.join(self.folder.name, "by_status.rpt")
        with open(path, "w", encoding="utf-8") as file:
            json.dump(document, file)
        report = self.reports.Item(path)

        self.assertTrue(report.SetParams(self.mox.dictionary({"S": "open"})))
        # A list selection makes the component capture the runtime's statement.
        self.assertTrue(report.SetSelection("Orders", [1, 3, 5]))
        statement = report.C_Report.SQLQueryString.get()
        self.assertTrue(statement.endswith("WHERE" + CRLF + "    Orders.ID IN (1,3,5)"), statement)
        self.assertNotIn("'open'", statement)

        self.assertTrue(report.SetParams(self.mox.dictionary({"S": "closed"})))
        statement = report.C_Report.SQLQueryString.get()
        self.assertNotIn("'open'", statement)
        self.assertNotIn("'closed'", statement)

        scratch = os.path.join(self.folder.name, "scratch.rpt")
        self.assertTrue(report.SaveReport(scratch))
        with open(scratch, encoding="utf-8") as file:
            self.assertNotIn("'open'", file.read())
        # Orders 1 and 3 are open, 5 is closed.
        self.assertEqual(self.export_records(scratch, "closed"), 1)
        self.assertEqual(self.export_records(scratch, "open"), 2)
        self.assertEqual(self.export_records(scratch, "none"), 0)

    def test_a_report_without_ole_db_tables_is_refused(self):
        document = report_document("")
        document["tables"][0]["driver"] = "crdbxml.dll"
        path = os.path.join(self.folder.name, "legacy.rpt")
        with open(path, "w", encoding="utf-8") as file:
            json.dump(document, file)
        report = self.reports.Item(path)
        self.assertFalse(report.CheckOLEDB())
        with self.assertRaises(ComError) as raised:
            report.GetParamsCollection()
        self.assertEqual(raised.exception.number, USER_CANCELLED)
        self.assertEqual(raised.exception.source, "LUD Crystal Engine")


class ParameterDialogOfAHeadlessServer(unittest.TestCase):
    """ludmoxd runs offscreen here: nobody can see or answer the parameter dialog."""

    def setUp(self):
        self.folder = tempfile.TemporaryDirectory()
        self.addCleanup(self.folder.cleanup)
        database = os.path.join(self.folder.name, "shop.db")
        make_database(database)
        env = dict(os.environ, QT_QPA_PLATFORM="offscreen")
        self.mox = Client(env=env, stderr=subprocess.DEVNULL)
        self.addCleanup(self.mox.close)
        # A server that waits on a dialog would never answer: end it so the test fails
        # instead of hanging.
        watchdog = threading.Timer(60, self.mox.process.kill)
        watchdog.start()
        self.addCleanup(watchdog.cancel)
        self.engine = self.mox.create("MoxEngine115")
        self.engine.Init(3, False, 0, 0)
        self.engine.SetLogonInfo(ECST_MSJET, database, "", "admin", "")
        # Held: a report reaches its engine through its collection.
        self.reports = self.engine.GetReports()
        document = report_document("{Orders.Status} = {?Status}")
        # Used by the selection and without a value: the dialog would ask for it.
        document["parameters"] = [{"name": "Status", "prompt": "Which status?", "valueType": 12}]
        path = os.path.join(self.folder.name, "orders.rpt")
        with open(path, "w", encoding="utf-8") as file:
            json.dump(document, file)
        self.report = self.reports.Item(path)

    def test_without_a_handler_the_dialog_counts_as_cancelled(self):
        # A handler for another event does not answer the dialog.
        self.mox.on(self.report.MoxEvents, "QueryParameters", lambda event: None)
        with self.assertRaises(ComError) as raised:
            self.report.C_Report
        self.assertEqual(raised.exception.number, USER_CANCELLED)
        self.assertEqual(raised.exception.description, "User Cancelled")
        self.assertTrue(self.report.UnloadRequest)

    def test_a_handler_answers_with_the_hosts_own_values(self):
        shown = []

        def answer(event):
            params, cancelled = event.args
            shown.append((params.Count(), cancelled))
            item = params.Item("Status")
            shown.append(item.LabelToolTip())
            item.Value = "open"

        self.mox.on(self.report.MoxEvents, "ShowParametersDialogEvent", answer)
        statement = self.report.C_Report.SQLQueryString.get()
        self.assertEqual(shown, [(1, False), "Which status?"])
        self.assertFalse(self.report.UnloadRequest)
        # The value selects records but never enters the statement a host reads back.
        self.assertNotIn("'open'", statement)
        # Answered once: the next run keeps the host's values and asks nobody.
        self.assertIsNone(self.report.SetParameters())
        self.assertEqual(len(shown), 2)

    def test_a_handler_that_cancels_cancels(self):
        self.mox.on(self.report.MoxEvents, "ShowParametersDialogEvent",
                    lambda event: event.args.__setitem__(1, True))
        with self.assertRaises(ComError) as raised:
            self.report.C_Report
        self.assertEqual(raised.exception.number, USER_CANCELLED)
        self.assertTrue(self.report.UnloadRequest)


if __name__ == "__main__":
    unittest.main()
