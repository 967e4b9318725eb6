#!/usr/bin/env bash
# Makes the German locale the log's timestamp test formats with (a fresh
# machine has only the C locales; the test skips, saying so, where this locale
# is missing). Run as root; does nothing when the locale is already there.
set -euo pipefail

locale_name=de_DE.UTF-8

if locale -a 2>/dev/null | grep -qix 'de_DE\.utf-\?8'; then
  exit 0
fi
if ! command -v localedef >/dev/null 2>&1 || [[ ! -e /usr/share/i18n/locales/de_DE ]]; then
  if ((EUID != 0)); then
    echo "setup-locale: not root; as root it would install the package locales and make $locale_name" >&2
    exit 1
  fi
  echo "setup-locale: installing locales"
  export DEBIAN_FRONTEND=noninteractive
  apt-get update -q
  apt-get install -y -q --no-install-recommends locales
fi
echo "setup-locale: making $locale_name"
localedef -i de_DE -c -f UTF-8 "$locale_name"
