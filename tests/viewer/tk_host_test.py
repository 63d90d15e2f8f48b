"""A host with a Tk window of its own shows a report preview inside that window.

The host drives ludmoxd through the Python host library as a desktop application does:
CreateViewerForm, CRView.Report, ShowReport with the id of its Tk frame, ParentResize,
answers to the viewer's SearchButtonClicked and PrintButtonClicked, a screenshot of its
window, and Destroy. It needs an X display: without one it runs itself again under
xvfb-run. Exit code 77 (skipped) when xvfb-run, Tk or the runtime's viewer is missing.

Run by CTest with LUDMOX_LUDMOXD, LUDMOX_EXAMPLES and PYTHONPATH set.
"""

import os
import re
import shutil
import subprocess
import sys
import tempfile
import time
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
    from PIL import Image
except ImportError:
    print("skipped: Tk or PIL is not installed (python3-tk, python3-pil)", file=sys.stderr)
    sys.exit(SKIP)
for tool in ("import", "xdotool", "xwininfo", "pdftoppm"):
    if not shutil.which(tool):
        print(f"skipped: {tool} is not installed", file=sys.stderr)
        sys.exit(SKIP)

from ludmox import Client, ComError  # noqa: E402

# The preview's windows must be real X11 windows to be embedded in the host's.
os.environ["QT_QPA_PLATFORM"] = "xcb"


def screenshot(window_id, path):
    """The host window as a PNG, by ImageMagick's import."""
    return subprocess.run(["import", "-window", str(window_id), path],
                          check=False).returncode == 0


def xdotool(*arguments):
    subprocess.run(["xdotool", *arguments], check=True)


def best_match(screen, reference, search):
    """The smallest mean difference of reference placed anywhere within search (x, y)
    pixels of the screen's corner, and where."""
    from PIL import ImageChops, ImageStat
    best = (256.0, None)
    for y in range(0, search[1], 2):
        for x in range(0, search[0], 2):
            window = screen.crop((x, y, x + reference.width, y + reference.height))
            score = ImageStat.Stat(ImageChops.difference(window, reference)).mean[0]
            if score < best[0]:
                best = (score, (x, y))
    return best


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
        """Lets both windows draw and take input: Tk's loop here, the server's between
        calls (each a real round trip, during which the host answers the viewer's events),
        with time for the X server to pass input on."""
        for _ in range(rounds):
            self.root.update()
            self.window.GetFHwnd()
            time.sleep(0.02)

    def test_preview_inside_the_host_window(self):
        engine = self.mox.create("MoxEngine115")
        engine.SetLogonInfo(ECST_MSJET, self.database, "", "admin", "")
        reports = engine.GetReports()
        report = reports.Item(self.report_path)

        window = self.window = self.mox.create("clsMoxViewer115")
        seen = []

        def on_search(event):
            seen.append(("search", event.args[0]))
            event.args[1] = False  # the host searches itself: the viewer must not

        def on_print(event):
            seen.append(("print",))
            event.args[0] = False  # the host prints itself: no print dialog may open

        self.mox.on(window, "SearchButtonClicked", on_search)
        self.mox.on(window, "PrintButtonClicked", on_print)
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

        # The host's window shows the report's first page as the PDF export draws it:
        # the title and the column band, found near the top left of the host's frame.
        shot = os.path.join(self.folder.name, "host.png")
        self.assertTrue(screenshot(self.frame.winfo_id(), shot))
        pdf_folder = os.path.join(self.folder.name, "pdf")
        subprocess.run([os.environ["LUDMOX_CLI"], "export", "--database", self.database,
                        "--output", pdf_folder, self.report_path], check=True,
                       stdout=subprocess.DEVNULL)
        # The control's 100 % is the screen's 96 dots per inch.
        subprocess.run(["pdftoppm", "-r", "96", "-f", "1", "-l", "1", "-png",
                        os.path.join(pdf_folder, "orders-by-customer.pdf"),
                        os.path.join(self.folder.name, "page")], check=True)
        page = Image.open(os.path.join(self.folder.name, "page-01.png")).convert("L")
        screen = Image.open(shot).convert("L")
        # From the page's top-left margin: the title and the first header band.
        reference = page.crop((48, 48, 48 + 480, 48 + 110))
        score, where = best_match(screen, reference, (200, 160))
        blank = best_match(screen.crop((0, 560, 880, 660)), reference.crop((0, 0, 480, 50)),
                           (2, 2))[0]
        self.assertLess(score, 12, f"the host window does not show the report ({where})")
        self.assertGreater(blank, score * 2)

        # Keys go to the window under the pointer (no window manager runs). A click on the
        # blank margin of the page activates the embedded window, a second one (not so soon
        # that it makes a double click, which would drill down) gives the pages the focus.
        margin = (self.frame.winfo_rootx() + 70, self.frame.winfo_rooty() + 400)

        # The server's window is the frame's child now.
        tree = subprocess.run(["xwininfo", "-children", "-id", str(self.frame.winfo_id())],
                              check=True, capture_output=True, text=True).stdout
        self.assertEqual(len(re.findall(r"0x[0-9a-f]+ \"ludmoxd\"", tree)), 1, tree)

        def click_margin():
            xdotool("mousemove", str(margin[0]), str(margin[1]))
            xdotool("click", "1")
            self.pump(5)
            time.sleep(0.6)
            xdotool("click", "1")
            self.pump(5)

        click_margin()
        xdotool("key", "ctrl+f")
        self.pump(5)
        xdotool("type", "Stockholm")
        self.pump(5)
        xdotool("key", "Return")
        self.pump()
        self.assertIn(("search", "Stockholm"), seen)
        time.sleep(0.6)
        click_margin()
        xdotool("key", "ctrl+p")
        self.pump()
        self.assertIn(("print",), seen)
        self.assertEqual(errors, [])

        window.Destroy()
        self.assertEqual(window.GetFHwnd(), 0)
        self.pump(2)


if __name__ == "__main__":
    unittest.main()
