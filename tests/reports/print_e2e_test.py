"""A host prints a report through ludmoxd and the real report runtime: it gives the picture
of the report's OLE object (OlePath, PictureBytes), prints on the PDF printers with
PrintReport and reads Status; the PDF files are read back with poppler's tools.

Run by CTest with LUDMOX_LUDMOXD set to the server and PYTHONPATH to python/.
"""

import glob
import json
import os
import shutil
import sqlite3
import struct
import subprocess
import tempfile
import time
import unittest
import zlib

from ludmox import Client

ECST_MSJET = 1
PRINTING_COMPLETED = 3


def png(width, height, rgb=(200, 30, 30)):
    """A PNG file of one colour."""
    def chunk(kind, data):
        return (struct.pack(">I", len(data)) + kind + data
                + struct.pack(">I", zlib.crc32(kind + data) & 0xFFFFFFFF))
    row = b"\x00" + bytes(rgb) * width
    return (b"\x89PNG\r\n\x1a\n"
            + chunk(b"IHDR", struct.pack(">IIBBBBB", width, height, 8, 2, 0, 0, 0))
            + chunk(b"IDAT", zlib.compress(row * height))
            + chunk(b"IEND", b""))


def report_document():
    return {
        "format": "ludmox-report",
        "version": 1,
        "page": {"paperSize": 9, "orientation": 2},
        "tables": [{
            "name": "Orders", "location": "shop.dbo.Orders", "driver": "crdb_ado.dll",
            "fields": [{"name": "ID", "type": "number"}],
        }],
        "sections": [
            {"name": "PH", "height": 800, "objects": [
                {"kind": "picture", "name": "Logo", "left": 0, "top": 0,
                 "width": 1440, "height": 720}]},
            # One record a page, so page ranges and copies show in the page count.
            {"name": "D", "height": 300, "newPageAfter": True, "objects": [
                {"kind": "field", "name": "IDField", "field": "{Orders.ID}",
                 "width": 1000, "height": 240}]},
        ],
    }


def pdf_info(path):
    out = subprocess.run(["pdfinfo", path], capture_output=True, text=True, check=True).stdout
    return dict(line.split(":", 1) for line in out.splitlines() if ":" in line)


def pdf_images(path):
    """(width, height) of every image drawn, in page order."""
    out = subprocess.run(["pdfimages", "-list", path], capture_output=True, text=True,
                         check=True).stdout.splitlines()[2:]
    return [(int(f[3]), int(f[4])) for f in (line.split() for line in out) if f[2] == "image"]


def pdf_text(path):
    return subprocess.run(["pdftotext", "-layout", path, "-"], capture_output=True, text=True,
                          check=True).stdout


@unittest.skipUnless(shutil.which("pdfinfo") and shutil.which("pdfimages"),
                     "poppler-utils are not installed")
class PrintThroughLudmoxd(unittest.TestCase):
    def setUp(self):
        self.folder = tempfile.TemporaryDirectory()
        self.addCleanup(self.folder.cleanup)
        root = self.folder.name
        self.database = os.path.join(root, "shop.db")
        with sqlite3.connect(self.database) as db:
            db.execute("CREATE TABLE Orders (ID INTEGER PRIMARY KEY)")
            db.executemany("INSERT INTO Orders VALUES (?)", [(i,) for i in range(1, 6)])
        self.report_file = os.path.join(root, "orders.rpt")
        with open(self.report_file, "w", encoding="utf-8") as file:
            json.dump(report_document(), file)
        self.pdf_folder = os.path.join(root, "pdf")
        self.archive_folder = os.path.join(root, "archive")
        os.environ["LUDMOX_PDF_PRINTER_DIR"] = self.pdf_folder
        os.environ["LUDMOX_PDF_PRINTERS"] = "Archive=" + self.archive_folder
        self.mox = Client(stderr=subprocess.DEVNULL)
        self.addCleanup(self.mox.close)
        engine = self.mox.create("MoxEngine115")
        engine.Init(3, False, 0, 0)
        engine.SetLogonInfo(ECST_MSJET, self.database, "", "admin", "")
        engine.SetProperties("DeviceName", "LUD Mox PDF")
        self.engine = engine
        self.reports = engine.GetReports()  # the report reaches its engine through it
        self.report = self.reports.Item(self.report_file)

    def printed(self, folder):
        files = sorted(glob.glob(os.path.join(folder, "*.pdf")), key=os.path.getmtime)
        self.assertTrue(files, "no PDF was printed into " + folder)
        return files[-1]

    def test_the_hosts_picture_bytes_and_file_reach_the_printed_page(self):
        self.assertEqual(self.report.PictureBytes, [0])
        self.report.PictureBytes = png(40, 20)
        self.assertTrue(self.report.PrintReport(False))
        status = self.report.Status
        self.assertEqual(status.Progress, PRINTING_COMPLETED)
        self.assertEqual(status.NumberOfPages, 5)
        first = self.printed(self.pdf_folder)
        self.assertEqual(pdf_images(first)[0], (40, 20))

        # A file wins over the bytes.
        logo = os.path.join(self.folder.name, "logo.png")
        with open(logo, "wb") as file:
            file.write(png(30, 10, (10, 10, 200)))
        self.report.OlePath = logo
        self.assertEqual(self.report.OlePath, logo)
        self.assertTrue(self.report.PrintReport(False))
        second = self.printed(self.pdf_folder)
        self.assertNotEqual(first, second)
        self.assertEqual(set(pdf_images(second)), {(30, 10)})

    def test_copies_collation_and_page_range_reach_the_pdf(self):
        self.assertTrue(self.report.PrintReport(False, 2, True, 2, 3))
        path = self.printed(self.pdf_folder)
        self.assertEqual(int(pdf_info(path)["Pages"]), 4)
        pages = [page.split() for page in pdf_text(path).split("\f") if page.strip()]
        self.assertEqual([p[-1] for p in pages], ["2", "3", "2", "3"])

        self.assertTrue(self.report.PrintReport(False, 2, False, 2, 3))
        pages = [page.split() for page in pdf_text(self.printed(self.pdf_folder)).split("\f")
                 if page.strip()]
        self.assertEqual([p[-1] for p in pages], ["2", "2", "3", "3"])

        # A range without an end prints everything, and no copies print one.
        self.assertTrue(self.report.PrintReport(False, 0, True, 3, 0))
        self.assertEqual(int(pdf_info(self.printed(self.pdf_folder))["Pages"]), 5)

    def test_a_named_printer_gets_the_hosts_paper_and_the_reports_orientation(self):
        self.report.DefaultPrinter = "archive"
        self.report.DefaultPaperSize = 11  # A5
        self.assertTrue(self.report.PrintReport(False, 1, True, 1, 1, True))
        info = pdf_info(self.printed(self.archive_folder))
        # A5 landscape: 595 x 420 points.
        self.assertTrue(info["Page size"].strip().startswith("595.276 x 419.528")
                        or info["Page size"].strip().startswith("595 x 420"), info["Page size"])
        self.assertFalse(glob.glob(os.path.join(self.pdf_folder, "*.pdf")))

    def test_a_cups_queue_gets_the_job_options(self):
        queue = os.environ.get("LUDMOX_CUPS_QUEUE", "LUDMox-CUPS")
        out = os.environ.get("LUDMOX_CUPS_PDF_DIR", "/var/spool/cups-pdf-ludmox")
        ready = (shutil.which("lpstat") and shutil.which("ipptool") and subprocess.run(
            ["lpstat", "-p", queue], capture_output=True).returncode == 0)
        if not ready:
            if os.environ.get("LUDMOX_REQUIRE_CUPS"):
                self.fail("the CUPS queue %s is not there (scripts/start-services.sh)" % queue)
            self.skipTest("no CUPS queue " + queue)
        before = set(glob.glob(os.path.join(out, "*.pdf")))
        self.report.DefaultPrinter = queue
        self.report.DefaultPaperSize = 11  # A5
        self.assertTrue(self.report.PrintReport(False, 2, True, 2, 3, True))
        jobs = subprocess.run(["lpstat", "-W", "all", "-o", queue], capture_output=True,
                              text=True, check=True).stdout.split()
        job = max(int(word.rsplit("-", 1)[1]) for word in jobs if word.startswith(queue + "-"))
        attributes = {}
        for _ in range(60):
            listing = subprocess.run(
                ["ipptool", "-tv", "ipp://localhost/jobs/%d" % job,
                 "/usr/share/cups/ipptool/get-job-attributes.test"],
                capture_output=True, text=True).stdout
            attributes = dict(
                (line.split("(")[0].strip(), line.split("=", 1)[1].strip())
                for line in listing.splitlines() if " = " in line)
            if attributes.get("job-state") == "completed":
                break
            time.sleep(0.5)
        self.assertEqual(attributes.get("copies"), "2")
        self.assertEqual(attributes.get("Collate"), "true")
        self.assertEqual(attributes.get("page-ranges"), "2-3")
        self.assertEqual(attributes.get("media"), "A5")
        self.assertEqual(attributes.get("job-state"), "completed")
        written = set(glob.glob(os.path.join(out, "*.pdf"))) - before
        self.assertEqual(len(written), 1)
        info = pdf_info(written.pop())
        self.assertEqual(int(info["Pages"]), 4)
        self.assertIn("A5", info["Page size"])


if __name__ == "__main__":
    unittest.main()
