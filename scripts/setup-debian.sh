#!/usr/bin/env bash
# Installs every Debian package the build, the tests and the examples need.
# Safe to run again: apt-get skips what is already installed.
set -euo pipefail

packages=(
    build-essential cmake ninja-build pkg-config ccache clang-format
    qt6-base-dev qt6-base-dev-tools libqt6sql6-sqlite libqt6sql6-psql libqt6sql6-odbc
    libgl-dev libxkbcommon-dev
    libgtest-dev libgmock-dev libbenchmark-dev
    libxlsxwriter-dev libcurl4-openssl-dev libsqlite3-dev sqlite3
    python3 python3-aiosmtpd python3-openpyxl poppler-utils qpdf
    python3-setuptools python3-venv python3-pip
    libreoffice-calc-nogui chromium
    postgresql postgresql-client
    unixodbc unixodbc-dev odbc-postgresql tdsodbc
    fonts-dejavu-core xvfb xauth python3-tk imagemagick x11-apps xdotool x11-utils python3-pil libxcb1-dev
    cups cups-bsd cups-client printer-driver-cups-pdf
    help2man man-db
)

missing=()
for p in "${packages[@]}"; do
    dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed' || missing+=("$p")
done

if [ ${#missing[@]} -gt 0 ]; then
    sudo_cmd=""
    [ "$(id -u)" -eq 0 ] || sudo_cmd="sudo"
    export DEBIAN_FRONTEND=noninteractive
    $sudo_cmd apt-get update -qq
    $sudo_cmd apt-get install -y -qq --no-install-recommends "${missing[@]}"
fi
