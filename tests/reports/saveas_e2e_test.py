"""A host exports and mails a sample report through ludmoxd and the real report runtime,
calling SaveAsPDF, SaveAsXLS, SaveAsHTML and SendReport by name, and checks the files and
the mail it receives.

Run by CTest with LUDMOX_LUDMOXD set to the server, LUDMOX_EXAMPLES to the examples folder
and PYTHONPATH to python/.
"""

import email
import email.policy
import glob
import os
import socket
import subprocess
import sys
import tempfile
import unittest
import zipfile

from ludmox import Client

ECST_MSJET = 1
PDF, EXCEL, HTML = 31, 38, 32
EXAMPLES = os.environ.get("LUDMOX_EXAMPLES", os.path.join(os.path.dirname(__file__),
                                                          "..", "..", "examples"))
REPORT = os.path.join(EXAMPLES, "reports", "sales-by-country.rpt")


def free_port():
    with socket.socket() as probe:
        probe.bind(("127.0.0.1", 0))
        return probe.getsockname()[1]


class SaveAsThroughLudmoxd(unittest.TestCase):
    def setUp(self):
        self.folder = tempfile.TemporaryDirectory()
        self.addCleanup(self.folder.cleanup)
        self.database = os.path.join(self.folder.name, "sample.db")
        subprocess.run([sys.executable, os.path.join(EXAMPLES, "make_sample_db.py"),
                        "--output", self.database], check=True, stdout=subprocess.DEVNULL)
        self.out = os.path.join(self.folder.name, "out")
        self.temp = os.path.join(self.folder.name, "temp")
        self.outbox = os.path.join(self.folder.name, "outbox")
        for folder in (self.out, self.temp, self.outbox):
            os.mkdir(folder)

    def host(self, smtp_url=None):
        env = dict(os.environ, LUDMOX_OUTBOX=self.outbox)
        env.pop("LUDMOX_SMTP_URL", None)
        if smtp_url:
            env["LUDMOX_SMTP_URL"] = smtp_url
        mox = Client(env=env, stderr=subprocess.DEVNULL)
        self.addCleanup(mox.close)
        engine = mox.create("MoxEngine115")
        engine.Init(3, False, 0, 0)
        engine.SetLogonInfo(ECST_MSJET, self.database, "", "admin", "")
        engine.SetProperties("LUDTempPath", self.temp)
        # The report reaches its engine through the collection, which the host keeps.
        self.reports = engine.GetReports()
        return self.reports.Item(REPORT)

    def assert_nothing_staged(self):
        self.assertEqual([name for name in os.listdir(self.out) if name.startswith(".")], [])
        self.assertEqual(os.listdir(self.temp), [], "no scratch file is left")

    def test_pdf_follows_the_valid_mail_rule_and_replaces_a_read_only_target(self):
        report = self.host()
        target = os.path.join(self.out, "sales.pdf")
        self.assertTrue(report.SaveAsPDF(target))
        self.assertFalse(os.path.exists(target), "no file without ValidMail or ForceSave")

        with open(target, "wb") as old:
            old.write(b"old")
        os.chmod(target, 0o400)
        report.ValidMail = True
        self.assertTrue(report.SaveAsPDF(target))
        with open(target, "rb") as written:
            self.assertEqual(written.read(5), b"%PDF-")
        self.assertFalse(report.SaveAsPDFError)
        self.assert_nothing_staged()

        # A bare name with TempFileOnly lands in the host's temporary folder.
        self.assertTrue(report.SaveAsPDF("scratch.pdf", False, True))
        self.assertEqual(os.listdir(self.temp), ["scratch.pdf"])

    def test_xlsx_is_a_workbook_with_the_reports_rows(self):
        report = self.host()
        target = os.path.join(self.out, "sales.xlsx")
        self.assertTrue(report.SaveAsXLS(target, False, True))
        self.assertFalse(report.SaveAsXLSError)
        self.assertTrue(zipfile.is_zipfile(target))
        import openpyxl
        sheet = openpyxl.load_workbook(target).active
        values = [cell.value for row in sheet.iter_rows() for cell in row]
        self.assertTrue(any(isinstance(value, (int, float)) for value in values),
                        "amounts are numeric cells")
        self.assert_nothing_staged()

    def test_html_is_one_page_of_text(self):
        report = self.host()
        target = os.path.join(self.out, "sales.html")
        self.assertTrue(report.SaveAsHTML(target, False, True, False, False))
        with open(target, encoding="utf-8") as page:
            text = page.read()
        self.assertIn("<html", text.lower())
        self.assertIn("<table", text.lower())
        self.assert_nothing_staged()

    def test_without_a_server_the_mail_goes_to_the_outbox(self):
        report = self.host()
        self.assertFalse(report.SendReport("ann@example.com", "Sales", "Attached."))
        self.assertTrue(report.SendMailError, "nothing goes out without ValidMail")
        self.assertEqual(os.listdir(self.outbox), [])

        report.ValidMail = True
        self.assertTrue(report.SendReport("ann@example.com", "Sales", "Attached.", PDF, False,
                                          False, "bob@example.com", "", "Sales2026"))
        self.assertFalse(report.SendMailError)
        messages = glob.glob(os.path.join(self.outbox, "*.eml"))
        self.assertEqual(len(messages), 1)
        with open(messages[0], "rb") as raw:
            message = email.message_from_binary_file(raw, policy=email.policy.default)
        self.assertEqual(message["Subject"], "Sales")
        self.assertIn("ann@example.com", message["To"])
        attachments = list(message.iter_attachments())
        self.assertEqual(len(attachments), 1)
        self.assertTrue(attachments[0].get_content().startswith(b"%PDF-"))
        self.assertFalse(os.path.exists(os.path.join(self.temp, "Sales2026.rpt")))

    def test_a_loopback_server_receives_the_mail_with_its_attachment(self):
        from aiosmtpd.controller import Controller

        class Keep:
            def __init__(self):
                self.envelopes = []

            async def handle_DATA(self, server, session, envelope):
                self.envelopes.append(envelope)
                return "250 OK"

        handler = Keep()
        port = free_port()
        controller = Controller(handler, hostname="127.0.0.1", port=port)
        controller.start()
        self.addCleanup(controller.stop)
        report = self.host(f"smtp://127.0.0.1:{port}")
        report.ValidMail = True
        self.assertTrue(report.SendReport("ann@example.com", "Sales", "Attached.", EXCEL, False,
                                          True, "", "carl@example.com"))
        self.assertEqual(len(handler.envelopes), 1)
        envelope = handler.envelopes[0]
        self.assertIn("carl@example.com", envelope.rcpt_tos)
        message = email.message_from_bytes(envelope.content, policy=email.policy.default)
        self.assertEqual(message["Subject"], "Sales")
        self.assertIsNone(message["Bcc"], "Bcc never appears in the headers")
        self.assertIn("Attached.", message.get_body(("plain",)).get_content())
        attachment = next(message.iter_attachments())
        self.assertTrue(attachment.get_content().startswith(b"PK"))
        self.assertEqual(os.listdir(self.outbox), [])


if __name__ == "__main__":
    unittest.main()
