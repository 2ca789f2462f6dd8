#!/bin/sh
# Removes the Unix host agent from a home whose inventory need not know it:
#
#   uninstall.sh HOME
#
# Its agents are stopped first; while one of them cannot be, nothing is removed. Configuration and logs stay.
# Exit status: 0 removed; 1 failed; 64 command line not understood.
set -u

home=${1-}
if [ $# -ne 1 ] || [ ! -d "$home/registry" ]; then
  echo "usage: uninstall.sh HOME" >&2
  exit 64
fi

for config in "$home"/config/ux.config "$home"/config/ux_*.config; do
  [ -e "$config" ] || continue
  instance=$(basename "$config" .config)
  instance=${instance#ux}
  "$home/bin/CorvelAgent" -h "$home" -c ${instance:+-o "${instance#_}"} stop ux || exit 1
done
rm -rf "$home"/zlpqor6/*/ux || exit 1
echo "ux removed"
