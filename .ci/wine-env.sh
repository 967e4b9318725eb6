# Sourced by the scripts that run Windows programs: a headless Wine prefix of
# the project's own and one persistent wine server for the whole run, so each
# program starts in well under a second instead of about three.
#   source .ci/wine-env.sh     (then run ctest in a Windows build folder)
#   wine_stop                  (at the end)
export WINEPREFIX="${WINEPREFIX:-${HOME}/.wine-alertsummary}"
export WINEDEBUG=-all
export WINEDLLOVERRIDES="mscoree,mshtml="
export WINEARCH="${WINEARCH:-win64}"
unset DISPLAY

# A prefix made before the 32-bit Wine was installed cannot start 32-bit
# programs ("could not load kernel32.dll"), and updating it in place fails the
# same way here: the project's prefix is then made anew.
wow64_ready() { [ -f "${WINEPREFIX}/drive_c/windows/syswow64/kernel32.dll" ]; }
if [ -f "${WINEPREFIX}/system.reg" ] && [ -x /usr/lib/wine/wine ] && ! wow64_ready; then
  wineserver -k >/dev/null 2>&1 || true
  rm -rf "${WINEPREFIX}"
fi
if [ ! -f "${WINEPREFIX}/system.reg" ]; then
  wineserver -k >/dev/null 2>&1 || true  # a persistent server would never let -w return
  wineboot -u </dev/null >/dev/null 2>&1 || true
  wineserver -w || true
fi
# The server and its services must not hold ctest's output pipes open. (A
# server already running makes -p fail; that server serves just as well.)
wineserver -p </dev/null >/dev/null 2>&1 || true
/usr/lib/wine/wine64 cmd /c exit </dev/null >/dev/null 2>&1 || true

wine_stop() { wineserver -k >/dev/null 2>&1 || true; }
