"""The client against the real server, found the way hosts find it: $LUDMOX_LUDMOXD."""

import os
import subprocess
import unittest

from ludmox import EMPTY, NOTHING, Client, ComError

TYPE_MISMATCH = -2147352571  # 0x80020005
INVALID_PARAMS = -32602


@unittest.skipUnless(os.environ.get("LUDMOX_LUDMOXD"), "LUDMOX_LUDMOXD names no server")
class RealServerTest(unittest.TestCase):
    def test_host_session(self):
        mox = Client(stderr=subprocess.DEVNULL)
        self.addCleanup(mox.close)
        self.assertEqual(mox.typelib()["name"], "LUDMoxViewer115")

        engine = mox.create("MoxEngine115")
        self.assertIs(engine.Init(3, True, 0, 0), None)
        with self.assertRaises(ComError) as caught:
            engine.Init("three", True, 0, 0)
        self.assertEqual((caught.exception.code, caught.exception.number),
                         (INVALID_PARAMS, TYPE_MISMATCH))
        self.assertEqual(caught.exception.data["argument"], 0)

        reports = engine.GetReports()
        self.assertIsNot(engine.GetReports(), reports)  # a new collection on every call
        report = reports.Item("/reports/orders.rpt")
        self.assertIs(reports.Item("/reports/orders.rpt"), report)
        self.assertIs(report.MoxEvents, report.MoxEvents)
        self.assertEqual(list(reports), [report])

        events = report.MoxEvents
        seen = []

        def on_query(event):
            seen.append((event.source, list(event.args)))
            event.args[1] = [1, 2, 3]
        mox.on(events, "QueryParameters", on_query)
        _, args = events.invoke_full("QueryParameters", "LUD#Customer", EMPTY)
        self.assertEqual(seen, [(events, ["LUD#Customer", EMPTY])])
        self.assertEqual(args, ["LUD#Customer", [1, 2, 3]])

        reports.Destroy()
        self.assertIs(reports.Item("/reports/orders.rpt"), NOTHING)
        self.assertEqual(mox.close(), 0)


if __name__ == "__main__":
    unittest.main()
