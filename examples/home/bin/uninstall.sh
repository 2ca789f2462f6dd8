#!/bin/sh
# Removes a product from this installation:
#
#   uninstall.sh -i PRODUCT PLATFORM
#
# Its agents are stopped first; while one of them cannot be, nothing is removed. Then goes what the product has in
# zlpqor6/PLATFORM/PRODUCT, and its line in the inventory. Configuration and logs stay.
# Exit status: 0 removed; 1 failed; 64 command line not understood.
set -u
LC_ALL=C # lines are bytes: none is left out because it is not UTF-8
export LC_ALL

home=$(cd "$(dirname "$0")/.." && pwd)
products=$home/registry/products.tbl

fail() {
  echo "uninstall.sh: $*" >&2
  exit 1
}

if [ $# -ne 3 ] || [ "$1" != -i ]; then
  echo "usage: uninstall.sh -i PRODUCT PLATFORM" >&2
  exit 64
fi
case $2$3 in *[!A-Za-z0-9]*) fail "\"$2\" for \"$3\" is not the name of a product and a platform" ;; esac
[ "$2" != ax ] || fail "product \"ax\" cannot be removed: the others need it"

line="^\"$2\",\"[^\"]*\",\"$3\","
grep -q "$line" "$products" || fail "product \"$2\" is not installed for $3"

for config in "$home/config/$2.config" "$home/config/$2"_*.config; do
  [ -e "$config" ] || continue
  instance=$(basename "$config" .config)
  instance=${instance#"$2"}
  "$home/bin/CorvelAgent" -h "$home" -c ${instance:+-o "${instance#_}"} stop "$2" || fail "$2 is still running"
done

rm -rf "$home/zlpqor6/$3/$2" || fail "cannot remove $home/zlpqor6/$3/$2"
sed "/$line/d" "$products" >"$products.new" || fail "cannot write in $home/registry"
mv "$products.new" "$products" || fail "cannot write $products"
echo "$2 removed"
