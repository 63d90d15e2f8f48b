#!/usr/bin/env bash
# Starts the services the tests use. Safe to run again.
set -euo pipefail
