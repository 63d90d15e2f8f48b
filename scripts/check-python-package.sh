#!/usr/bin/env bash
# Installs the Python host library into a fresh virtual environment, as a host project
# would, and drives the built server with it: an engine, a sample report, a PDF export.
#
# LUDMOX_LUDMOXD names the server (default: build/apps/ludmoxd/ludmoxd). The wheel is built
# with Debian's python3 and its setuptools, since the machines reach no package index; the
# virtual environment is a plain one, so the package must bring everything it needs.
set -euo pipefail
cd "$(dirname "$0")/.."

python=/usr/bin/python3
server=${LUDMOX_LUDMOXD:-build/apps/ludmoxd/ludmoxd}
if [ ! -x "$server" ]; then
    echo "check-python-package: no ludmoxd at $server; build it or set LUDMOX_LUDMOXD" >&2
    exit 1
fi
server=$(realpath "$server")
examples=$(realpath examples)
version=$(sed -n 's/^project(LudMox VERSION \([0-9.]*\).*/\1/p' CMakeLists.txt)

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# A copy keeps the build's folders (build/, *.egg-info) out of the checkout.
mkdir "$work/source"
cp -r python/pyproject.toml python/README.md python/ludmox python/ludmox_client.py \
    "$work/source/"
"$python" -m pip wheel --quiet --no-build-isolation --no-deps --no-index \
    --wheel-dir "$work/wheels" "$work/source"
"$python" -m venv "$work/venv"
"$work/venv/bin/python" -m pip install --quiet --no-index "$work/wheels"/*.whl

"$python" "$examples/make_sample_db.py" --output "$work/sample.db" >/dev/null

# Run outside the checkout and without PYTHONPATH: only the installed package can answer.
cd "$work"
env -u PYTHONPATH LUDMOX_LUDMOXD="$server" QT_QPA_PLATFORM=offscreen \
    "$work/venv/bin/python" - "$version" "$examples/reports/sales-by-country.rpt" \
    "$work/sample.db" "$work/sales.pdf" <<'PY'
import importlib.metadata
import os
import subprocess
import sys

import ludmox
import ludmox_client
from ludmox import Client



def check(condition, message):
    if not condition:
        sys.exit(f"check-python-package: {message}")


version, report_file, database, target = sys.argv[1:]
installed = importlib.metadata.version("ludmox-client")
check(installed == version == ludmox.__version__,
      f"versions differ: installed {installed}, project {version}, {ludmox.__version__}")
check(ludmox.__file__.startswith(sys.prefix), f"ludmox imported from {ludmox.__file__}")
check(ludmox_client.Client is Client, "ludmox_client is not the package's")
check(os.path.exists(os.path.join(os.path.dirname(ludmox.__file__), "py.typed")),
      "py.typed is not installed")

with Client(stderr=subprocess.DEVNULL) as mox:
    engine = mox.create("MoxEngine115")
    engine.Init(3, False, 0, 0)
    engine.SetLogonInfo(1, database, "", "admin", "")
    reports = engine.GetReports()
    report = reports.Item(report_file)
    report.ValidMail = True
    check(report.SaveAsPDF(target) is True and report.SaveAsPDFError is False,
          f"SaveAsPDF failed: {engine.LastError}")
with open(target, "rb") as pdf:
    data = pdf.read()
check(data.startswith(b"%PDF-") and b"%%EOF" in data[-32:], f"{target} is no complete PDF")
print(f"check-python-package: ludmox-client {installed} exported {len(data)} bytes of PDF")
PY
