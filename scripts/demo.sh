#!/usr/bin/env bash
# The main job on the bundled example: sets up, builds the tool, copies
# examples/install to a scratch folder, runs one collection cycle over it and
# prints the summary of the stored alerts.
set -euo pipefail
cd "$(dirname "$0")/.."

[[ "${SKIP_SETUP:-0}" == 1 ]] || scripts/setup.sh

cmake -S . -B build/linux -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null
cmake --build build/linux --target alertsummary -j"$(nproc)"

scratch=build/demo/install
rm -rf build/demo && mkdir -p build/demo
cp -r examples/install "$scratch"
tool=build/linux/tools/alertsummary

printf '\n== One collection cycle over %s\n' "$scratch"
"$tool" collect --once --install-dir "$scratch"
printf '\n== Stored alerts\n'
"$tool" report --install-dir "$scratch"
printf '\n== Script alerts stored: '
"$tool" count --install-dir "$scratch" --filter "Script Alert"
printf '\nFiles now marked processed: %s of %s\n' \
  "$(find "$scratch" -name 'PROC_*' | wc -l)" "$(find examples/install -name '*.eml' | wc -l)"
printf 'Look at one alert the way the library reads it:\n  %s inspect "%s"\n' "$tool" \
  "examples/install/File Server/AlertReports/Sent items/$(ls "examples/install/File Server/AlertReports/Sent items" | head -1)"
