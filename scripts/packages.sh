# Sourced by the scripts beside it: what they need from Debian 12, and how it gets there.
# shellcheck shell=sh disable=SC2034  # the lists are for whoever sources this

packages_build='g++ cmake ninja-build pkg-config libexpat1-dev libmicrohttpd-dev libcurl4-openssl-dev
  nettle-dev nlohmann-json3-dev libcli11-dev'
packages_run='curl ksh'
packages_tests='libgtest-dev libgmock-dev libbenchmark-dev libyaml-cpp-dev'
packages_fuzz='clang libclang-rt-14-dev'
packages_coverage='gcovr'
packages_analysis='clang-tidy cppcheck shellcheck'

as_root() {
  if [ "$(id -u)" -eq 0 ]; then "$@"; else sudo "$@"; fi
}

# apt_get ARGUMENTS...: never asks; its chatter is shown only when it fails.
apt_get() {
  apt_log=$(mktemp)
  apt_status=0
  as_root env DEBIAN_FRONTEND=noninteractive apt-get -q "$@" >"$apt_log" 2>&1 </dev/null || apt_status=$?
  [ $apt_status -eq 0 ] || cat "$apt_log" >&2
  rm -f "$apt_log"
  return $apt_status
}

update_once() {
  [ -n "${updated-}" ] && return
  apt_get update && updated=yes
}

# install_packages NAME...: installs those that are missing. Touches nothing when none is.
install_packages() {
  missing=''
  for package in "$@"; do
    case $(dpkg-query -W -f '${db:Status-Abbrev}' "$package" 2>/dev/null) in
      ii*) ;;
      *) missing="$missing $package" ;;
    esac
  done
  [ -z "$missing" ] && return
  echo "installing$missing"
  # shellcheck disable=SC2086  # one word for each package
  update_once && apt_get install -y --no-install-recommends $missing
}

# fetch_exporter DIR: makes sure that there is a prometheus-node-exporter and leaves its path in `exporter`. The package is
# only unpacked into DIR, not installed: installing it would start a network service and enable it at boot.
fetch_exporter() {
  exporter=/usr/bin/prometheus-node-exporter
  [ -x "$exporter" ] && return
  exporter=$1/usr/bin/prometheus-node-exporter
  [ -x "$exporter" ] && return
  echo "unpacking prometheus-node-exporter into $1"
  mkdir -p "$1" || return
  download_exporter "$1" 2>/dev/null || { update_once && download_exporter "$1"; } || {
    echo "prometheus-node-exporter, the agent, cannot be downloaded" >&2
    return 1
  }
  dpkg-deb -x "$1"/prometheus-node-exporter_*.deb "$1" && rm -f "$1"/prometheus-node-exporter_*.deb
}

download_exporter() {
  # As root, apt would fetch as a user of its own, who may not write here.
  (cd "$1" && apt-get -qq -o APT::Sandbox::User="$(id -un)" download prometheus-node-exporter >/dev/null)
}
