#!/bin/bash
# The Debian package: built by cpack from this build tree, unpacked into a scratch root with
# dpkg -x, and run from there with nothing pointing back at the build tree: autocli finds its
# libraries through its RUNPATH and the mesk plug-in beside itself.
. "$(dirname "$0")/lib.sh"
: "${MESK_BUILD_DIR:?MESK_BUILD_DIR must name the build directory}"

PACKAGES="$E2E_DIR/packages"
ROOT="$E2E_DIR/unpacked"

case_ "cpack builds a package that declares its dependencies"
_capture cpack -G DEB --config "$MESK_BUILD_DIR/CPackConfig.cmake" -B "$PACKAGES" \
    -D CPACK_INSTALL_CMAKE_PROJECTS= \
    -D CPACK_INSTALL_SCRIPTS="$MESK_SOURCE_DIR/tests/e2e/package_stage.cmake" \
    -D MESK_PACKAGE_BUILD_DIR="$MESK_BUILD_DIR"
expect_rc 0
DEB=$(ls "$PACKAGES"/mesk_*.deb 2>/dev/null | head -n 1)
[ -n "$DEB" ] || { _fail "no package in $PACKAGES"; finish; exit 1; }
expect_eq "$(dpkg-deb -f "$DEB" Package)" mesk "package name"
DEPENDS=$(dpkg-deb -f "$DEB" Depends)
for library in libsqlite3-0 libuuid1 libstdc++6; do
    expect_eq "$([[ ", $DEPENDS," == *", $library,"* ]] && echo declared)" declared "$library in Depends ($DEPENDS)"
done

case_ "the package holds the programs, libraries, plug-in and completion in the standard places"
CONTENTS=$(dpkg-deb -c "$DEB" | awk '{ print $6 }')
for path in ./usr/bin/autocli ./usr/bin/hostsim ./usr/lib/libkalmor_autocli.so.0 \
    ./usr/lib/libhostctl.so.0 ./usr/lib/autocli/plugins/libmesk.so \
    ./usr/share/bash-completion/completions/autocli; do
    expect_eq "$(grep -cxF "$path" <<<"$CONTENTS")" 1 "$path in the package"
done
expect_eq "$(grep -c other_mesk_plugin <<<"$CONTENTS")" 0 "test plug-ins in the package"

case_ "unpacked into a scratch root, autocli loads its own libraries and plug-in"
dpkg -x "$DEB" "$ROOT"
expect_eq "$?" 0 "dpkg -x"
_capture env -u AUTOCLI_PLUGIN_PATH -u LD_LIBRARY_PATH LD_DEBUG=libs "$ROOT/usr/bin/autocli" mesk --help
expect_rc 0
expect_out_has "storage"
# The dynamic loader names each library it initialises; the paths hold "..", so normalise.
LOADED=$(sed -n 's/.*calling init: //p' <<<"$ERR" | xargs -r realpath -m)
for library in lib/libkalmor_autocli.so.0 lib/libhostctl.so.0 lib/autocli/plugins/libmesk.so; do
    expect_eq "$(grep -cxF "$(realpath -m "$ROOT/usr/$library")" <<<"$LOADED")" 1 "$library loaded"
done
expect_eq "$(grep -cF "$(realpath -m "$MESK_BUILD_DIR")/" <<<"$LOADED")" 0 "libraries from the build tree"

case_ "the unpacked hostsim and autocli drive the simulated host"
_capture env -u LD_LIBRARY_PATH "$ROOT/usr/bin/hostsim" reset
expect_rc 0
_capture env -u AUTOCLI_PLUGIN_PATH -u LD_LIBRARY_PATH "$ROOT/usr/bin/autocli" mesk datastore name get --formatter json
expect_rc 0
expect_out '{"Name":"meskDatastore"}'

case_ "the unpacked completion script completes with the unpacked autocli"
# shellcheck disable=SC2016
_capture env -u AUTOCLI_PLUGIN_PATH bash -c '
    source "$1"
    COMP_WORDS=("$2" mesk st); COMP_CWORD=2
    _autocli
    printf "%s\n" "${COMPREPLY[@]}"' bash "$ROOT/usr/share/bash-completion/completions/autocli" \
    "$ROOT/usr/bin/autocli"
expect_out "storage"

finish
