#!/bin/bash
# The Debian package: built by scripts/package from this build tree (lintian included),
# installed with dpkg into a throwaway root, run from there with nothing pointing back at the
# build tree and no variable naming the simulated host, then purged.
. "$(dirname "$0")/lib.sh"
: "${MESK_BUILD_DIR:?MESK_BUILD_DIR must name the build directory}"

SYSROOT="$E2E_DIR/sysroot"
# dpkg below another root, without chroot (the maintainer scripts honour DPKG_ROOT) and
# without needing root; the root has no libc6 of its own to satisfy Depends.
dpkg_root() {
    dpkg --root="$SYSROOT" --log="$E2E_DIR/dpkg.log" --force-not-root --force-script-chrootless \
        --force-depends "$@"
}

case_ "scripts/package builds a package that lintian passes"
_capture "$MESK_SOURCE_DIR/scripts/package" "$MESK_BUILD_DIR"
expect_rc 0
expect_eq "$(grep -c '^E:' <<<"$ERR")" 0 "lintian errors"
DEB=$(sed -n '/\.deb$/p' <<<"$OUT")
[ -f "$DEB" ] || { _fail "no package named on stdout"; finish; exit 1; }
DEPENDS=$(dpkg-deb -f "$DEB" Depends)
for library in libc6 libstdc++6; do
    expect_eq "$([[ ", $DEPENDS," == *", $library "* ]] && echo declared)" declared "$library in Depends ($DEPENDS)"
done
expect_eq "$(dpkg-deb -f "$DEB" Recommends)" bash-completion "Recommends"
expect_eq "$(dpkg-deb -f "$DEB" Version)" "$("$AUTOCLI" --version | sed -n '1s/^autocli //p')" "version"

case_ "installed into a throwaway root, in the standard places, stripped"
mkdir -p "$SYSROOT/var/lib/dpkg/updates" "$SYSROOT/var/lib/dpkg/info"
touch "$SYSROOT/var/lib/dpkg/status"
_capture dpkg_root -i "$DEB"
expect_rc 0
LIBDIR="usr/lib/$(dpkg-architecture -qDEB_HOST_MULTIARCH 2>/dev/null || gcc -print-multiarch)"
for path in usr/bin/autocli usr/bin/hostsim "$LIBDIR/mesk/libkalmor_autocli.so.0" \
    "$LIBDIR/mesk/libhostctl.so.0" "$LIBDIR/autocli/plugins/libmesk.so" \
    usr/share/bash-completion/completions/autocli usr/share/doc/mesk/copyright \
    usr/share/man/man1/autocli-mesk.1.gz; do
    expect_eq "$([ -e "$SYSROOT/$path" ] && echo present)" present "$path"
done
expect_eq "$(find "$SYSROOT/usr" -name '*other_mesk_plugin*' | wc -l)" 0 "test plug-ins in the package"
for elf in usr/bin/autocli "$LIBDIR/mesk/libhostctl.so.0"; do
    expect_eq "$(readelf -S "$SYSROOT/$elf" | grep -c '\.debug_info')" 0 "debug information in $elf"
done

case_ "libraries are looked for only at absolute paths and \$ORIGIN, plug-ins only beside autocli"
INSTALLED="$E2E_DIR/installed"
cmake --install "$MESK_BUILD_DIR" --prefix "$INSTALLED" >/dev/null
ELVES=0
for file in $(ninja -C "$MESK_BUILD_DIR" -t targets all | sed -n "s|^\([^:]*\): .*|$MESK_BUILD_DIR/\1|p") \
    $(find "$INSTALLED" "$SYSROOT/usr" -type f); do
    case "$file" in *.o | *.a) continue ;; esac
    [ -f "$file" ] && [ "$(head -c 4 "$file" | tr -d '\0')" = $'\x7fELF' ] || continue
    ELVES=$((ELVES + 1))
    # Each entry on a line of its own, the empty ones included.
    BAD=$(readelf -d "$file" | sed -n 's/.*R[UN]*PATH.*\[\(.*\)\]$/\1:/p' | tr ':' '\n' | sed '$d' |
        grep -v '^/\|^\$ORIGIN\(/\|$\)')
    if [ -n "$BAD" ]; then _fail "$file searches '${BAD//$'\n'/"', '"}'"; fi
done
expect_eq "$([ "$ELVES" -ge 10 ] && echo many)" many "ELF files checked ($ELVES)"
for program in "$AUTOCLI" "$INSTALLED/bin/autocli"; do
    expect_eq "$(cd "$E2E_DIR" && env -u AUTOCLI_PLUGIN_PATH LD_DEBUG=libs "$program" mesk cluster get \
        2>&1 >/dev/null | grep 'trying file=[^/]')" "" "relative library paths tried by $program"
done
strace -f -e trace=openat,open,stat,newfstatat -o "$E2E_DIR/trace" \
    env -u AUTOCLI_PLUGIN_PATH "$INSTALLED/bin/autocli" mesk cluster get >/dev/null 2>&1
expect_eq "$(grep -c "$MESK_BUILD_DIR" "$E2E_DIR/trace")" 0 "build-tree paths the installed autocli opens"
expect_eq "$(grep -q "$INSTALLED/.*/autocli/plugins/libmesk.so\"" "$E2E_DIR/trace" && echo yes)" yes \
    "the installed plug-in opened"

case_ "the installed programs open their own libraries at the first try"
# No plug-in: the plug-in's own lookup of the host-control library is its business.
mkdir -p "$E2E_DIR/no-plugins"
for program in autocli hostsim; do
    AUTOCLI_PLUGIN_PATH="$E2E_DIR/no-plugins" strace -f -e trace=openat,open,stat,newfstatat \
        -o "$E2E_DIR/trace" "$INSTALLED/bin/$program" --version >/dev/null 2>&1
    expect_eq "$(grep ENOENT "$E2E_DIR/trace" | grep -c "$INSTALLED")" 0 \
        "failed lookups below the installed tree by $program"
done

# The installed programs use /var/lib/hostsim: in a mount namespace of their own, that is the
# throwaway root's. Without the right to make one, the remaining cases are skipped.
in_sysroot() {
    env -u AUTOCLI_PLUGIN_PATH -u LD_LIBRARY_PATH -u HOSTSIM_STATE -u MESK_HOST_ROOT \
        unshare $UNSHARE_FLAGS sh -c 'mount --bind "$0/var/lib" /var/lib && exec "$@"' "$SYSROOT" "$@"
}
UNSHARE_FLAGS=-m
[ "$(id -u)" -eq 0 ] || UNSHARE_FLAGS=-rm
if ! unshare $UNSHARE_FLAGS true 2>/dev/null; then
    echo "SKIP: the installed programs' runs: no mount namespace for this user"
    finish
    exit
fi

case_ "the installed hostsim and autocli share one simulated host without any variable"
_capture in_sysroot "$SYSROOT/usr/bin/hostsim" reset
expect_rc 0
_capture in_sysroot "$SYSROOT/usr/bin/autocli" mesk cluster get --formatter json
expect_rc 1
expect_err_has "Mesk Clustering is not enabled on this host"
_capture in_sysroot "$SYSROOT/usr/bin/autocli" mesk trace get --formatter json
expect_rc 0
expect_out_has '"MESK Traces Directory":"/scratch/mesktrace"'
expect_eq "$([ -f "$SYSROOT/var/lib/hostsim/state.db" ] && echo present)" present "state in /var/lib/hostsim"
if [ "$(id -u)" -eq 0 ] && command -v setpriv >/dev/null; then
    chmod o+x "$E2E_DIR"
    _capture in_sysroot setpriv --reuid=65534 --regid=65534 --clear-groups \
        "$SYSROOT/usr/bin/autocli" mesk datastore name get --formatter json
    expect_rc 0
    expect_out '{"Name":"meskDatastore"}'
fi

case_ "the installed completion script completes with the installed autocli"
# shellcheck disable=SC2016
_capture env -u AUTOCLI_PLUGIN_PATH bash -c '
    source "$1"
    COMP_WORDS=("$2" mesk st); COMP_CWORD=2
    _autocli
    printf "%s\n" "${COMPREPLY[@]}"' bash "$SYSROOT/usr/share/bash-completion/completions/autocli" \
    "$SYSROOT/usr/bin/autocli"
expect_out "storage"

case_ "purging removes the package's files and the simulated host"
_capture dpkg_root --purge mesk
expect_rc 0
expect_eq "$(find "$SYSROOT" -mindepth 1 -not -path "$SYSROOT/var/lib/dpkg*" -type f | head -n 3)" "" \
    "files left after the purge"

finish
