#!/bin/sh
# Installs version 010100000 of the product ux:
#
#   install.sh HOME
#
# There is no program to bring along, since the agent is Debian's: what is installed is the entry in the inventory.
# Exit status: 0 installed; 1 failed; 64 command line not understood.
set -u

home=${1-}
if [ $# -ne 1 ] || [ ! -d "$home/registry" ]; then
  echo "usage: install.sh HOME" >&2
  exit 64
fi
products=$home/registry/products.tbl

{
  echo '"ux","Unix host agent","lx8266","010100000","100"'
  grep -v '^"ux",' "$products"
} >"$products.new" && mv "$products.new" "$products"
