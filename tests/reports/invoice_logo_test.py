"""The sample invoice shows each customer's logo where the report places it.

The logo is no part of the report file: the component's picture handler reads the path
from the customer's record while the group header is formatted, loads the file and puts
it into the "LUDPICTURE_" object. The test exports invoices through the ludmox host (engine
and report object) and looks at the rendered page: the object's area is painted for a
customer with a logo and blank for one without, and the page holds an image with the logo
file's own size.
"""
import json
import os
import sqlite3
import struct
import subprocess
import sys
import tempfile
import unittest

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(os.path.dirname(HERE))
EXAMPLES = os.path.join(ROOT, "examples")
LUDMOX = os.environ["LUDMOX_CLI"]


def png_size(path):
    with open(path, "rb") as file:
        header = file.read(24)
    return struct.unpack(">II", header[16:24])


def read_ppm(path):
    with open(path, "rb") as file:
        data = file.read()
    parts = data.split(maxsplit=4)
    assert parts[0] == b"P6", parts[0]
    width, height = int(parts[1]), int(parts[2])
    return width, height, parts[4][-(width * height * 3):]


class InvoiceLogo(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.folder = tempfile.TemporaryDirectory()
        cls.database = os.path.join(cls.folder.name, "sample.db")
        subprocess.run([sys.executable, os.path.join(EXAMPLES, "make_sample_db.py"),
                        "--output", cls.database], check=True, capture_output=True)
        with open(os.path.join(EXAMPLES, "reports", "invoice.rpt"), encoding="utf-8") as file:
            report = json.load(file)
        logo = next(o for s in report["sections"] for o in s["objects"]
                    if o.get("name", "").startswith("LUDPICTURE_"))
        margins = report["page"]["margins"]
        # 20 twips to the point; the page is rendered at 72 dots per inch, a point a pixel.
        cls.area = ((margins["left"] + logo["left"]) // 20, (margins["top"] + logo["top"]) // 20,
                    logo["width"] // 20, logo["height"] // 20)

    @classmethod
    def tearDownClass(cls):
        cls.folder.cleanup()

    def order_of_customer(self, with_logo):
        with sqlite3.connect(self.database) as db:
            condition = "<> ''" if with_logo else "= ''"
            return db.execute(
                "SELECT o.OrderID, c.LogoPath FROM Orders o JOIN Customers c "
                "ON c.CustomerID = o.CustomerID WHERE COALESCE(c.LogoPath, '') " + condition +
                " ORDER BY o.OrderID LIMIT 1").fetchone()

    def export_invoice(self, order):
        output = os.path.join(self.folder.name, "order-%d" % order)
        os.makedirs(output, exist_ok=True)
        subprocess.run([LUDMOX, "export", "--database", self.database, "--output", output,
                        "--param", "FromOrder=%d" % order, "--param", "ToOrder=%d" % order,
                        os.path.join(EXAMPLES, "reports", "invoice.rpt")],
                       check=True, capture_output=True)
        return os.path.join(output, "invoice.pdf")

    def painted_share(self, pdf):
        prefix = pdf[:-4]
        subprocess.run(["pdftoppm", "-r", "72", "-f", "1", "-l", "1", "-singlefile", pdf,
                        prefix], check=True)
        width, _, pixels = read_ppm(prefix + ".ppm")
        left, top, area_width, area_height = self.area
        painted = 0
        for y in range(top, top + area_height):
            for x in range(left, left + area_width):
                r, g, b = pixels[(y * width + x) * 3:(y * width + x) * 3 + 3]
                painted += (r, g, b) != (255, 255, 255)
        return painted / (area_width * area_height)

    def test_the_logo_fills_its_place(self):
        order, logo_path = self.order_of_customer(with_logo=True)
        pdf = self.export_invoice(order)
        # Proportional height: the logo keeps its shape inside the object, so a good part
        # of the object's area is the picture, not all of it.
        self.assertGreater(self.painted_share(pdf), 0.3)
        images = subprocess.run(["pdfimages", "-list", "-f", "1", "-l", "1", pdf],
                                check=True, capture_output=True, text=True).stdout
        sizes = {tuple(int(v) for v in line.split()[3:5]) for line in images.splitlines()[2:]}
        self.assertIn(png_size(logo_path), sizes)

    def test_a_customer_without_a_logo_leaves_the_place_blank(self):
        found = self.order_of_customer(with_logo=False)
        self.assertIsNotNone(found)
        self.assertLess(self.painted_share(self.export_invoice(found[0])), 0.02)


if __name__ == "__main__":
    unittest.main()
