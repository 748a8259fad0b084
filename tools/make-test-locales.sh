#!/bin/sh
# Generates the POSIX locales the code-page tests run under: a single-byte
# Latin-1 and CP1252 locale, a double-byte (GBK) locale, and a UTF-8 locale.
# Already present locales are left alone.
set -e
have() { locale -a 2>/dev/null | tr 'A-Z' 'a-z' | sed 's/-//g' | grep -qx "$1"; }
gen() { # name charmap alias
  if ! have "$3"; then
    localedef -i "$1" -f "$2" "$4" 2>/dev/null || localedef -i "$1" -f "$2" "$4" || true
  fi
}
gen en_US ISO-8859-1 en_us.iso88591 en_US.ISO-8859-1
gen de_DE CP1252 de_de.cp1252 de_DE.CP1252
gen zh_CN GBK zh_cn.gbk zh_CN.GBK
gen de_DE UTF-8 de_de.utf8 de_DE.UTF-8
gen en_US UTF-8 en_us.utf8 en_US.UTF-8
