#!/usr/bin/env bash
# The main job: builds LUD Mox, makes the sample database, exports every sample report in
# examples/reports to PDF with the ludmox host and one of them to XLSX and HTML, and prints
# the invoices (the customer's logo and the product pictures of the file store) through the
# component on its PDF printer.
#
#   bash scripts/run-examples.sh [output folder]     (default: out/examples)
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/setup-debian.sh

build_dir=${LUDMOX_BUILD_DIR:-build}
output=${1:-out/examples}
cmake -S . -B "$build_dir" -G Ninja -DCMAKE_BUILD_TYPE=Release \
    -DLUDMOX_WERROR="${LUDMOX_WERROR:-OFF}"
cmake --build "$build_dir" --target ludmox

mkdir -p "$output"
python3 examples/make_sample_db.py --output "$output/sample.db"
"$build_dir/apps/ludmox/ludmox" export --database "$output/sample.db" --output "$output" \
    --reports examples/reports
for format in xlsx html; do
    "$build_dir/apps/ludmox/ludmox" export examples/reports/sales-by-country.rpt \
        --format "$format" --database "$output/sample.db" --output "$output"
done
LUDMOX_PDF_PRINTER_DIR="$output/printed" "$build_dir/apps/ludmox/ludmox" print \
    --database "$output/sample.db" --printer "LUD Mox PDF" \
    --param FromOrder=1 --param ToOrder=3 --param InvoiceDate=2026-12-06 --param DueDays=14 \
    --param "Note=Thank you for your order." examples/reports/invoice.rpt
echo "PDF, XLSX and HTML files are in $output, printed invoices in $output/printed"
