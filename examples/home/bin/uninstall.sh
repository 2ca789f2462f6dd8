#!/bin/sh
# Removes a product from this installation:
#
#   uninstall.sh -i PRODUCT ARCHITECTURE
#
# Its agents are stopped first; while one of them cannot be, nothing is removed. Configuration and logs stay.
# Exit status: 0 removed; 1 failed; 64 command line not understood.
set -u

home=$(cd "$(dirname "$0")/.." && pwd)
products=$home/registry/products.tbl

fail() {
  echo "uninstall.sh: $*" >&2
  exit 1
}

if [ $# -ne 3 ] || [ "$1" != -i ]; then
  echo "usage: uninstall.sh -i PRODUCT ARCHITECTURE" >&2
  exit 64
fi
[ "$2" = ux ] || fail "product \"$2\" cannot be removed; there is ux"

others=$(grep -v "^\"$2\",\"[^\"]*\",\"$3\"," "$products")
[ "$others" != "$(cat "$products")" ] || fail "product \"$2\" is not installed for $3"

for config in "$home/config/$2.config" "$home/config/$2"_*.config; do
  [ -e "$config" ] || continue
  instance=$(basename "$config" .config)
  instance=${instance#"$2"}
  "$home/bin/CorvelAgent" -h "$home" -c ${instance:+-o "${instance#_}"} stop "$2" || fail "$2 is still running"
done

echo "$others" >"$products.new" || fail "cannot write in $home/registry"
mv "$products.new" "$products" || fail "cannot write $products"
echo "$2 removed"
