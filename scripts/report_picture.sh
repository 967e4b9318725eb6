#!/usr/bin/env bash
# Remakes docs/report-example.png: the HTML report of the bundled example
# install folder after one cycle over a copy of it, with a fixed "made" time
# and a made-up install folder name, photographed by headless Chromium.
#   scripts/report_picture.sh [build folder]     (default build/linux)
set -euo pipefail
cd "$(dirname "$0")/.."
tool=${1:-build/linux}/tools/alertsummary
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cp -r examples/install "$work/install"
export TZ=UTC
"$tool" collect --once --install-dir "$work/install" --log-dir "$work" >/dev/null
"$tool" report --install-dir "$work/install" --format html --output "$work/report.html" \
  --made-at "2026/12/20 09:00:00" --install-label 'D:\Alerting Service'
chromium --headless --no-sandbox --disable-gpu --no-first-run --disable-background-networking \
  --disable-component-update --disable-sync --user-data-dir="$work/profile" --hide-scrollbars \
  --window-size=1180,1320 --screenshot="$PWD/docs/report-example.png" "file://$work/report.html" 2>/dev/null
