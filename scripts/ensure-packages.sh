#!/usr/bin/env bash
# Makes sure the Debian packages that a command needs are installed (scripts/packages.txt).
#   scripts/ensure-packages.sh demo|test|ci
# On a machine that has them all it only asks dpkg once and prints nothing. Missing packages are
# installed with apt-get when running as root (apt-get update first, only then); otherwise the
# exact apt-get line is printed and the exit status is 1.
set -euo pipefail
here="$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)"

usage() {
  echo "usage: $0 demo|test|ci" >&2
  exit 2
}
[[ $# -eq 1 ]] || usage
case "$1" in
  demo) wanted=(demo) ;;
  test) wanted=(demo test) ;;
  ci) wanted=(demo test ci) ;;
  *) usage ;;
esac

packages=()
while read -r package group _; do
  [[ -z "$package" || "$package" == \#* ]] && continue
  for want in "${wanted[@]}"; do
    if [[ "$group" == "$want" ]]; then packages+=("$package"); fi
  done
done <"$here/packages.txt"

# One dpkg-query for the whole list; a package it does not report as installed is missing.
installed=" $(dpkg-query -W -f='${Package}:${Status}\n' "${packages[@]}" 2>/dev/null |
  sed -n 's/:install ok installed$//p' | tr '\n' ' ' || true) "
missing=()
for package in "${packages[@]}"; do
  [[ "$installed" == *" $package "* ]] || missing+=("$package")
done
((${#missing[@]} == 0)) && exit 0

command_line="apt-get install -y --no-install-recommends ${missing[*]}"
if [[ "$(id -u)" -ne 0 ]]; then
  cat >&2 <<MESSAGE
$(basename "$0"): these Debian packages are missing: ${missing[*]}
Install them as root, then run the command again:
  sudo apt-get update && sudo $command_line
MESSAGE
  exit 1
fi

echo "== installing the missing packages: ${missing[*]}"
export DEBIAN_FRONTEND=noninteractive
apt-get update -qq
# shellcheck disable=SC2086
apt-get install -y -qq --no-install-recommends "${missing[@]}"
