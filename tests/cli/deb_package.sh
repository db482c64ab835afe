#!/usr/bin/env bash
# Builds the Debian package from a built tree, unpacks it into a clean
# folder and runs the unpacked tool: its version, and a command that needs
# the unpacked installation data.
#
#   deb_package.sh BUILD_DIR VERSION
set -euo pipefail
build="$1"
version="$2"
tmp="$(mktemp -d /tmp/vlr_deb_XXXXXX)"
trap 'rm -rf "$tmp"' EXIT
(cd "$tmp" && cpack --config "$build/CPackConfig.cmake" -B "$tmp/pkg" >"$tmp/cpack.log" 2>&1) \
  || { cat "$tmp/cpack.log"; exit 1; }
deb="$tmp/pkg/import_wss_${version}_amd64.deb"
[ -f "$deb" ] || { echo "no $deb"; ls "$tmp/pkg"; exit 1; }
depends="$(dpkg-deb -f "$deb" Depends)"
for lib in libxml2 libexpat1 libtiff; do
  case "$depends" in
    *"$lib"*) ;;
    *) echo "Depends lacks $lib: $depends"; exit 1 ;;
  esac
done
dpkg -x "$deb" "$tmp/root"
for f in usr/bin/import_wss usr/lib/import_wss/main_delete_file \
  usr/share/import_wss/des/vlr_errors_catalog.des usr/share/import_wss/keys/Sensor.key; do
  [ -e "$tmp/root/$f" ] || { echo "the package lacks $f"; exit 1; }
done
out="$(env -u VELORAN_INIT_DIR "$tmp/root/usr/bin/import_wss" --version)"
[ "$out" = "import_wss $version" ] || { echo "unexpected version: $out"; exit 1; }
# A product that is not there: the unpacked tool finds its data and says so.
set +e
msg="$(env -u VELORAN_INIT_DIR "$tmp/root/usr/bin/import_wss" import "$tmp/missing.N1" 2>&1)"
status=$?
set -e
[ $status -ne 0 ] || { echo "a missing product gave status 0"; exit 1; }
case "$msg" in
  *"$tmp/missing.N1"*"No such file"*) ;;
  *) echo "unexpected message: $msg"; exit 1 ;;
esac
echo "ok: $(basename "$deb"), Depends: $depends"
