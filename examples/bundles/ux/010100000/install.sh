#!/bin/sh
# Installs the Unix host agent, or removes it:
#
#   install.sh HOME [RESPONSES]
#
# RESPONSES is a file of lines KEY=value: ACTION, install or uninstall; PORT, where the agent is to answer when it has no
# configuration yet. By default it is ux_Silent_Install.txt beside this. The version is the name of this folder. Agents
# that run go on as they are until they are restarted.
# Exit status: 0 done; 1 failed; 64 command line not understood.
set -u
LC_ALL=C # lines are bytes: none is left out because it is not UTF-8
export LC_ALL

fail() {
  echo "install.sh: $*" >&2
  exit 1
}

# Each file is written under another name until it is whole: what was there before stays when the disk is full.
new=''
trap '[ -z "$new" ] || rm -f "$new"' EXIT

# becomes FILE: what has been written takes the place of the file.
becomes() {
  mv "$new" "$1" || fail "cannot write $1"
}

# response KEY: its value. Response files keep the line ends that they were sent with.
response() {
  sed -n "s/^$1=//p" "$responses" | tail -n 1 | tr -d '\r'
}

here=$(cd "$(dirname "$0")" && pwd)
home=${1-}
responses=${2-$here/ux_Silent_Install.txt}
if [ $# -lt 1 ] || [ $# -gt 2 ] || [ ! -d "$home/registry" ] || [ ! -r "$responses" ]; then
  echo "usage: install.sh HOME [RESPONSES]" >&2
  exit 64
fi
case $(response ACTION) in
  install) ;;
  uninstall) exec "$here/uninstall.sh" "$home" ;;
  *) fail "ACTION in $responses is neither install nor uninstall" ;;
esac

version=$(basename "$here")
products=$home/registry/products.tbl
platform=$(sed -n 's/^"ax","[^"]*","\([^"]*\)".*/\1/p' "$products" | head -n 1)
[ -n "$platform" ] || fail "$products lists no product ax, so the platform is not known"

# An agent may be running from the old program.
program=$home/zlpqor6/$platform/ux/bin/prometheus-node-exporter
mkdir -p "${program%/*}" || fail "cannot write in $home/zlpqor6"
new=$program.new
{ cp "$here/prometheus-node-exporter" "$new" && chmod 755 "$new"; } || fail "cannot copy the program"
becomes "$program"

if [ ! -e "$home/config/ux.config" ]; then
  new=$home/config/ux.config.new
  echo "PORT=$(response PORT)" >"$new" || fail "cannot write in $home/config"
  becomes "$home/config/ux.config"
fi
for config in "$home"/config/ux.config "$home"/config/ux_*.config; do
  [ -e "$config" ] || continue
  new=$config.new
  { awk '!/^PROGRAM=/' "$config" && echo "PROGRAM=$program"; } >"$new" || fail "cannot write in $home/config"
  becomes "$config"
done

new=$products.new
{
  echo "\"ux\",\"Unix host agent\",\"$platform\",\"$version\",\"100\"" &&
    awk '!/^"ux",/' "$products"
} >"$new" || fail "cannot write in $home/registry"
becomes "$products"
echo "ux $version installed for $platform"
