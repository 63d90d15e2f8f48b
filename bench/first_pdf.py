#!/usr/bin/env python3
"""Time from starting ludmoxd to a finished one-page PDF (SaveAsPDF), process start included.

    python3 bench/first_pdf.py BUILD_DIR [RUNS]

Each run starts a fresh server, makes the engine, logs on to the sample database and
exports examples/reports/sales-by-country.rpt (one page); prints every run and the median in ms.
"""
import os
import statistics
import subprocess
import sys
import tempfile
import time

here = os.path.dirname(os.path.abspath(__file__))
root = os.path.dirname(here)
sys.path.insert(0, os.path.join(root, "python"))

from ludmox import Client  # noqa: E402


def main() -> int:
    if len(sys.argv) < 2:
        sys.exit(__doc__)
    build = os.path.abspath(sys.argv[1])
    runs = int(sys.argv[2]) if len(sys.argv) > 2 else 7
    server = os.path.join(build, "apps", "ludmoxd", "ludmoxd")
    report_file = os.path.join(root, "examples", "reports", "sales-by-country.rpt")
    os.environ.setdefault("QT_QPA_PLATFORM", "offscreen")
    with tempfile.TemporaryDirectory() as work:
        database = os.path.join(work, "sample.db")
        subprocess.run([sys.executable, os.path.join(root, "examples", "make_sample_db.py"),
                        "--output", database], check=True, stdout=subprocess.DEVNULL)
        times = []
        for run in range(runs):
            target = os.path.join(work, f"first-{run}.pdf")
            start = time.perf_counter()
            with Client(server, stderr=subprocess.DEVNULL) as mox:
                engine = mox.create("MoxEngine115")
                engine.Init(3, False, 0, 0)
                engine.SetLogonInfo(1, database, "", "admin", "")
                reports = engine.GetReports()  # the report lives while its collection does
                report = reports.Item(report_file)
                report.ValidMail = True
                if report.SaveAsPDF(target) is not True:
                    sys.exit(f"first_pdf: SaveAsPDF failed: {engine.LastError}")
                elapsed = (time.perf_counter() - start) * 1000
            times.append(elapsed)
            print(f"run {run + 1}: {elapsed:.0f} ms")
        print(f"median of {runs}: {statistics.median(times):.0f} ms (target 150 ms)")
    return 0


if __name__ == "__main__":
    sys.exit(main())
