#!/usr/bin/env bash
# Rebuilds examples/install from the alert generator: 36 alerts over five
# component folders (each found by another kind of marker file), the
# "Predefine Alerts" folder and the other fixed-name folders, plus a malformed
# and an empty message. Usage: examples/regenerate.sh PATH/TO/alertgen
set -euo pipefail
cd "$(dirname "$0")"
gen=${1:?usage: regenerate.sh PATH/TO/alertgen}
rm -rf install
"$gen" install 36 --seed 2026 --components 5 --size 6000 >/dev/null
cd install
mv Component1 "Active Directory"
mv Component2 "File Server" && mv "File Server/info.dat" "File Server/info_FSA.dat"
mv Component3 SharePoint && mv SharePoint/info.dat SharePoint/info_SP.dat
mv Component4 "SQL Server" && mv "SQL Server/info.dat" "SQL Server/info_SS.dat"
mv Component5 Exchange && mv Exchange/info.dat Exchange/Exchange.dat
mkdir -p "All Environment Changes" "Activity Outside of Business Hours_Alert/AlertReports/Sent items" "Anomaly Alerts" Docs
printf 'Not a component folder: it holds no marker file.\n' > Docs/readme.txt
# No subject and a multipart body whose boundary never closes: marked without a row.
printf 'From: alerts@corp.example\r\nContent-Type: multipart/mixed; boundary="never"\r\n\r\n--never\r\nContent-Type: image/png\r\n\r\n\x89PNG\x00\x01 junk without an end' \
  > "File Server/AlertReports/Outbox/Alert_malformed.eml"
: > "SharePoint/AlertReports/Sent items/Alert_empty.eml"
