#!/usr/bin/env bash
# Installs the build in BUILD_DIR (default: build) into a temporary prefix and uses it as a
# developer outside this tree would: examples/cpp-host built with find_package(LudMox) and
# once more with pkg-config, both run against the sample database; the programs' --version
# and manual pages; the shared libraries' exported symbols; and the Python client installed
# into a fresh virtual environment against the installed ludmoxd.
set -euo pipefail

root=$(cd "$(dirname "$0")/.." && pwd)
build=${BUILD_DIR:-$root/build}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix
export QT_QPA_PLATFORM=offscreen

cmake --install "$build" --prefix "$prefix" >/dev/null
libdir=$(cd "$prefix" && ls -d lib*/ | head -n 1)
libdir=${libdir%/}
version=$(sed -n 's/^project(LudMox VERSION \([0-9.]*\).*/\1/p' "$root/CMakeLists.txt")

# Private headers never reach the prefix.
if find "$prefix/include" -name '*_p.h' | grep -q .; then
    echo "check-package: private headers were installed" >&2
    exit 1
fi

# The programs tell the project's version and have manual pages.
for program in ludmox ludmoxd; do
    "$prefix/bin/$program" --version | grep -qx "$program $version" \
        || { echo "check-package: $program --version is not $version" >&2; exit 1; }
    MANPATH="$prefix/share/man" man -P cat "$program" 2>/dev/null | grep -A1 '^NAME' \
        | grep -q "^ *$program - " \
        || { echo "check-package: man $program shows nothing" >&2; exit 1; }
done

# Only marked classes and functions are exported: nothing of the runtime's internals.
for library in "$prefix/$libdir"/libludmox.so "$prefix/$libdir"/libludmoxreportrt.so; do
    if readelf --dyn-syms --wide "$library" | awk '$5 == "GLOBAL" && $7 != "UND" {print $8}' \
        | c++filt | grep -E '^(reportrt::|automation::(Dispatcher|HandleTable|LineChannel))' \
        | grep -v '^reportrt::registerRuntime()$'; then
        echo "check-package: $library exports internals (above)" >&2
        exit 1
    fi
done

python3 "$prefix/share/ludmox/examples/make_sample_db.py" --output "$work/sample.db" >/dev/null

# The command line finds the installed sample reports by itself.
"$prefix/bin/ludmox" export --database "$work/sample.db" --output "$work/samples" >/dev/null
reports=$(ls "$prefix/share/ludmox/examples/reports"/*.rpt | wc -l)
if [ "$reports" -eq 0 ] || [ "$(ls "$work/samples"/*.pdf | wc -l)" -ne "$reports" ]; then
    echo "check-package: ludmox export did not export the $reports installed sample reports" >&2
    exit 1
fi

# CMake package.
cmake -S "$root/examples/cpp-host" -B "$work/host-cmake" -G Ninja \
    -DCMAKE_PREFIX_PATH="$prefix" -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build "$work/host-cmake" >/dev/null
LD_LIBRARY_PATH="$prefix/$libdir" "$work/host-cmake/cpp-host" "$work/sample.db" \
    "$root/examples/reports" "$work/cmake.pdf"

# pkg-config.
PKG_CONFIG_PATH="$prefix/$libdir/pkgconfig" c++ -std=c++20 -fPIC -O2 \
    -o "$work/cpp-host-pc" "$root/examples/cpp-host/main.cpp" \
    $(PKG_CONFIG_PATH="$prefix/$libdir/pkgconfig" pkg-config --cflags --libs ludmox)
LD_LIBRARY_PATH="$prefix/$libdir" "$work/cpp-host-pc" "$work/sample.db" \
    "$root/examples/reports" "$work/pkgconfig.pdf"

# The parameters ask for orders 100 to 110, the selection keeps those up to 105.
for pdf in "$work/cmake.pdf" "$work/pkgconfig.pdf"; do
    invoices=$(pdftotext -layout "$pdf" - | sed -n 's/.*Invoice no\. *\([0-9]*\).*/\1/p' | tr '\n' ' ')
    if [ "$invoices" != "100 101 102 103 104 105 " ]; then
        echo "check-package: $pdf has invoices '$invoices', not 100 to 105" >&2
        exit 1
    fi
done

# The Python client, installed into a fresh virtual environment, drives the installed server.
LUDMOX_LUDMOXD="$prefix/bin/ludmoxd" bash "$root/scripts/check-python-package.sh"
echo "check-package: installed package works (CMake, pkg-config, Python, programs, manual pages)"
