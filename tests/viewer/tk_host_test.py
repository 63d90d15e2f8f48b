"""A host with a Tk window of its own shows a report preview inside that window.

The host drives ludmoxd through the Python host library as a desktop application does:
CreateViewerForm, CRView.Report, ShowReport with the id of its Tk frame, ParentResize,
answers to the viewer's SearchButtonClicked and PrintButtonClicked, a screenshot of its
window, and Destroy. It needs an X display: without one it runs itself again under
xvfb-run. Exit code 77 (skipped) when xvfb-run, Tk or the runtime's viewer is missing.

Run by CTest with LUDMOX_LUDMOXD, LUDMOX_EXAMPLES and PYTHONPATH set.
"""

import os
import shutil
import subprocess
import sys
import tempfile
import unittest

SKIP = 77
ECST_MSJET = 1
CANNOT_CREATE = 429

if not os.environ.get("DISPLAY"):
    if not shutil.which("xvfb-run") or os.environ.get("LUDMOX_UNDER_XVFB"):
        print("skipped: no display and no xvfb-run", file=sys.stderr)
        sys.exit(SKIP)
    environment = dict(os.environ, LUDMOX_UNDER_XVFB="1")
    environment.pop("QT_QPA_PLATFORM", None)
    sys.exit(subprocess.call(["xvfb-run", "-a", "-s", "-screen 0 1280x1024x24",
                              sys.executable, *sys.argv], env=environment))

try:
    import tkinter
except ImportError:
    print("skipped: Tk is not installed (python3-tk)", file=sys.stderr)
    sys.exit(SKIP)

from ludmox import Client, ComError  # noqa: E402

# The preview's windows must be real X11 windows to be embedded in the host's.
os.environ["QT_QPA_PLATFORM"] = "xcb"


def screenshot(window_id, path):
    """The host window as an image file, by ImageMagick's import or xwd."""
    if shutil.which("import"):
        command = ["import", "-window", str(window_id), path]
    elif shutil.which("xwd"):
        command = ["xwd", "-id", str(window_id), "-out", path]
    else:
        return False
    return subprocess.run(command, check=False).returncode == 0


class TkHostTest(unittest.TestCase):
    def setUp(self):
        self.folder = tempfile.TemporaryDirectory()
        self.addCleanup(self.folder.cleanup)
        examples = os.environ["LUDMOX_EXAMPLES"]
        self.database = os.path.join(self.folder.name, "sample.db")
        subprocess.run([sys.executable, os.path.join(examples, "make_sample_db.py"),
                        "--output", self.database], check=True, stdout=subprocess.DEVNULL)
        self.report_path = os.path.join(examples, "reports", "orders-by-customer.rpt")

        self.root = tkinter.Tk()
        self.addCleanup(self.root.destroy)
        self.root.geometry("900x700+0+0")
        self.frame = tkinter.Frame(self.root, width=880, height=660, bg="grey")
        self.frame.pack(fill="both", expand=True)
        self.root.update()

        self.mox = Client()
        self.addCleanup(self.mox.close)

    def pump(self, rounds=20):
        """Lets both windows draw: Tk's loop here, the server's between calls."""
        for _ in range(rounds):
            self.root.update()
            self.mox.typelib()

    def test_preview_inside_the_host_window(self):
        engine = self.mox.create("MoxEngine115")
        engine.SetLogonInfo(ECST_MSJET, self.database, "", "admin", "")
        reports = engine.GetReports()
        report = reports.Item(self.report_path)

        window = self.mox.create("clsMoxViewer115")
        seen = []
        self.mox.on(window, "SearchButtonClicked",
                    lambda event: (seen.append(("search", event.args[0])),
                                   event.args.__setitem__(1, False)))
        self.mox.on(window, "PrintButtonClicked",
                    lambda event: (seen.append(("print",)), event.args.__setitem__(0, False)))
        errors = []
        self.mox.on(window, "OnReportSourceError",
                    lambda event: errors.append(list(event.args)))
        try:
            form = window.CreateViewerForm(0)
        except ComError as error:
            if error.number == CANNOT_CREATE:
                print("skipped: the runtime's viewer control is not installed", file=sys.stderr)
                sys.exit(SKIP)
            raise
        self.assertNotEqual(form, 0)
        self.assertEqual(window.GetFHwnd(), form)

        window.CRView.Report = report
        host = self.frame.winfo_id()
        self.assertEqual(window.ShowReport(1, host), 0)
        self.assertEqual(errors, [])
        # Twips: 15 to a pixel at 96 DPI.
        window.ParentResize(0, 0, 880 * 15, 660 * 15)
        self.pump()
        self.assertGreaterEqual(window.CRView.GetCurrentPageNumber(), 1)

        # The lead completes these with the real viewer's toolbar (xdotool clicks on the
        # search and print buttons); the host's answers then keep the viewer from acting.
        shot = os.path.join(self.folder.name, "host.png")
        if screenshot(self.root.winfo_id(), shot):
            self.assertGreater(os.path.getsize(shot), 0)

        window.Destroy()
        self.assertEqual(window.GetFHwnd(), 0)
        self.pump(2)


if __name__ == "__main__":
    unittest.main()
