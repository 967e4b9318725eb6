# Sourced by the scripts that run Windows programs: a headless Wine prefix of
# the project's own and one persistent wine server for the whole run, so each
# program starts in well under a second instead of about three.
#   source .ci/wine-env.sh     (then run ctest in a Windows build folder)
#   wine_stop                  (at the end)
# It leaves WINE_X86_SKIP_REASON empty where 32-bit Windows programs can run,
# and otherwise the reason they cannot, for the caller to print.
wine_project_prefix="${HOME}/.wine-alertsummary"
export WINEPREFIX="${WINEPREFIX:-${wine_project_prefix}}"
export WINEDEBUG=-all
export WINEDLLOVERRIDES="mscoree,mshtml="
export WINEARCH="${WINEARCH:-win64}"
unset DISPLAY

wine32_loader="${WINE32_LOADER:-/usr/lib/wine/wine}"
wine64_loader=/usr/lib/wine/wine64
wine_made_marker="${WINEPREFIX}/.made-by-alertsummary"

# A kernel without 32-bit emulation refuses every 32-bit program with "Exec
# format error", the 32-bit Wine loader included, and the `wine` wrapper
# starts through that loader even for x64 programs. Asking the loader for its
# version tells without a prefix.
WINE_X86_SKIP_REASON=""
if [ ! -x "${wine32_loader}" ]; then
  WINE_X86_SKIP_REASON="the 32-bit Wine loader ${wine32_loader} is not installed (package wine32:i386)"
elif ! wine32_answer=$("${wine32_loader}" --version 2>&1 </dev/null); then
  WINE_X86_SKIP_REASON="this machine cannot run 32-bit programs (${wine32_loader}: ${wine32_answer##*: })"
fi
if [ -z "${WINE_X86_SKIP_REASON}" ]; then wine_boot=(wineboot -u); else wine_boot=("${wine64_loader}" wineboot.exe -u); fi

wow64_ready() { [ -f "${WINEPREFIX}/drive_c/windows/syswow64/kernel32.dll" ]; }
wine_prefix_is_ours() { [ -f "${wine_made_marker}" ] || [ "${WINEPREFIX}" = "${wine_project_prefix}" ]; }

# A prefix made before the 32-bit Wine was installed cannot start 32-bit
# programs ("could not load kernel32.dll"), and updating it in place fails the
# same way: a prefix of the project's own is then made anew. Anybody else's
# prefix is never removed.
if [ -z "${WINE_X86_SKIP_REASON}" ] && [ -f "${WINEPREFIX}/system.reg" ] && ! wow64_ready; then
  if wine_prefix_is_ours; then
    wineserver -k >/dev/null 2>&1 || true
    rm -rf "${WINEPREFIX}"
  else
    WINE_X86_SKIP_REASON="the Wine prefix ${WINEPREFIX} has no 32-bit part and is not the project's own (unset WINEPREFIX to use the project's)"
  fi
fi
if [ ! -f "${WINEPREFIX}/system.reg" ]; then
  wineserver -k >/dev/null 2>&1 || true  # a persistent server would never let -w return
  if [ ! -e "${WINEPREFIX}" ]; then
    mkdir -p "${WINEPREFIX}"
    touch "${wine_made_marker}"
  fi
  "${wine_boot[@]}" </dev/null >/dev/null 2>&1 || true
  wineserver -w || true
fi
# The server and its services must not hold ctest's output pipes open. (A
# server already running makes -p fail; that server serves just as well.)
wineserver -p </dev/null >/dev/null 2>&1 || true
"${wine64_loader}" cmd /c exit </dev/null >/dev/null 2>&1 || true

wine_stop() { wineserver -k >/dev/null 2>&1 || true; }
