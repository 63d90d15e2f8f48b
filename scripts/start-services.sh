#!/usr/bin/env bash
# Starts the services the tests use. Safe to run again.
set -euo pipefail

# PostgreSQL for the report runtime's server-database tests: a cluster listening on
# 127.0.0.1 and a role and database "ludmox_test" (password "ludmox_test"). The tests
# read LUDMOX_PG_HOST, LUDMOX_PG_PORT, LUDMOX_PG_USER, LUDMOX_PG_PASSWORD and
# LUDMOX_PG_DATABASE, with these values as defaults.
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
    echo "start-services: PostgreSQL $version/$cluster on 127.0.0.1:$port, database $database"
}

start_postgresql
