#!/usr/bin/env bash
# Starts the services the tests use. Safe to run again.
set -euo pipefail

# PostgreSQL for the report runtime's server-database tests: a cluster listening on
# 127.0.0.1 and a role and database "ludmox_test" (password "ludmox_test"). The tests
# read LUDMOX_PG_HOST, LUDMOX_PG_PORT, LUDMOX_PG_USER, LUDMOX_PG_PASSWORD and
# LUDMOX_PG_DATABASE, with these values as defaults. The ODBC run of the tests reaches the same
# database through psqlODBC with a DSN-less connect string: it needs only the packages
# (odbc-postgresql registers its drivers in /etc/odbcinst.ini), no DSN.
start_postgresql() {
    if ! command -v pg_lsclusters >/dev/null 2>&1; then
        echo "start-services: PostgreSQL is not installed (scripts/setup-debian.sh installs it)" >&2
        return 1
    fi
    local as_postgres=(runuser -u postgres --)
    if [ "$(id -u)" -ne 0 ]; then
        as_postgres=(sudo -u postgres)
    fi
    local version cluster port status
    if ! read -r version cluster port status _ < <(pg_lsclusters --no-header | head -n 1); then
        version=$(find /usr/lib/postgresql -mindepth 1 -maxdepth 1 -printf '%f\n' | sort -V | tail -n 1)
        pg_createcluster "$version" main >/dev/null
        read -r version cluster port status _ < <(pg_lsclusters --no-header | head -n 1)
    fi
    if [ "$status" != "online" ]; then
        pg_ctlcluster "$version" "$cluster" start
    fi
    for _ in $(seq 1 30); do
        pg_isready -q -h 127.0.0.1 -p "$port" && break
        sleep 1
    done
    pg_isready -q -h 127.0.0.1 -p "$port"

    local user=ludmox_test password=ludmox_test database=ludmox_test
    if ! "${as_postgres[@]}" psql -p "$port" -tAc "SELECT 1 FROM pg_roles WHERE rolname = '$user'" | grep -q 1; then
        "${as_postgres[@]}" psql -p "$port" -q -c "CREATE ROLE $user LOGIN PASSWORD '$password'"
    else
        "${as_postgres[@]}" psql -p "$port" -q -c "ALTER ROLE $user LOGIN PASSWORD '$password'"
    fi
    if ! "${as_postgres[@]}" psql -p "$port" -tAc "SELECT 1 FROM pg_database WHERE datname = '$database'" | grep -q 1; then
        "${as_postgres[@]}" psql -p "$port" -q -c "CREATE DATABASE $database OWNER $user"
    fi
    # A role whose password holds what an ODBC connect string treats specially, for the test
    # that logs on with it through psqlODBC (the password goes in as a psql variable, quoted
    # by psql).
    local quote_user=ludmox_quote quote_password='p;w}d{x=y}} ;UID=postgres;'
    if ! "${as_postgres[@]}" psql -p "$port" -tAc "SELECT 1 FROM pg_roles WHERE rolname = '$quote_user'" | grep -q 1; then
        "${as_postgres[@]}" psql -p "$port" -q -c "CREATE ROLE $quote_user LOGIN"
    fi
    echo "ALTER ROLE $quote_user LOGIN PASSWORD :'password';" \
        | "${as_postgres[@]}" psql -p "$port" -q -v ON_ERROR_STOP=1 -v password="$quote_password"
    echo "start-services: PostgreSQL $version/$cluster on 127.0.0.1:$port, database $database"
}

# CUPS with a print queue on the cups-pdf backend, so printing goes the way a user's printer
# takes it: Qt's printer, a CUPS job, a PDF file written by the backend. The queue is
# LUDMOX_CUPS_QUEUE ("LUDMox-CUPS") and the backend writes into LUDMOX_CUPS_PDF_DIR
# (/var/spool/cups-pdf-ludmox). cupsd is started directly: CI has no service manager.
start_cups() {
    local queue=${LUDMOX_CUPS_QUEUE:-LUDMox-CUPS}
    local out=${LUDMOX_CUPS_PDF_DIR:-/var/spool/cups-pdf-ludmox}
    if ! command -v cupsd >/dev/null 2>&1 || [ ! -e /usr/lib/cups/backend/cups-pdf ]; then
        echo "start-services: CUPS or cups-pdf is not installed (scripts/setup-debian.sh installs them)" >&2
        return 1
    fi
    local sudo_cmd=""
    [ "$(id -u)" -eq 0 ] || sudo_cmd="sudo"
    $sudo_cmd mkdir -p "$out"
    $sudo_cmd chmod 1777 "$out"
    # The backend reads /etc/cups/cups-pdf-<name>.conf for the URI cups-pdf:/<name>.
    $sudo_cmd tee /etc/cups/cups-pdf-ludmox.conf >/dev/null <<CONF
Out $out
AnonDirName $out
Label 0
UserUMask 0000
Grp lpadmin
DecodeHexStrings 1
CONF
    if ! lpstat -r >/dev/null 2>&1 || lpstat -r 2>&1 | grep -q "not running"; then
        $sudo_cmd mkdir -p /run/cups
        $sudo_cmd cupsd
    fi
    for _ in $(seq 1 30); do
        lpstat -r 2>/dev/null | grep -q "is running" && break
        sleep 1
    done
    lpstat -r | grep -q "is running"
    if ! lpstat -p "$queue" >/dev/null 2>&1; then
        $sudo_cmd lpadmin -p "$queue" -E -v cups-pdf:/ludmox \
            -P /usr/share/ppd/cups-pdf/CUPS-PDF_opt.ppd -D "LUD Mox test printer"
    fi
    $sudo_cmd cupsenable "$queue"
    $sudo_cmd cupsaccept "$queue"
    # Completed jobs stay listed with their attributes for the tests to read.
    $sudo_cmd cupsctl PreserveJobHistory=Yes PreserveJobFiles=No >/dev/null 2>&1 || true
    echo "start-services: CUPS queue $queue writes PDF files into $out"
}

start_postgresql
start_cups
