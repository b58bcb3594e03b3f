#!/bin/bash
# README's commands, as a newcomer types them, in a fresh copy of the checkout: the first
# command (which configures and builds), then every command of the "For scripts" and
# "Install and package" sections in order; the install goes below the scratch directory.
. "$(dirname "$0")/lib.sh"

COPY="$E2E_DIR/checkout"
mkdir -p "$COPY"
tar -C "$MESK_SOURCE_DIR" --exclude='./build*' --exclude=./.git --exclude=./.hostsim -cf - . |
    tar -C "$COPY" -xf -
cd "$COPY" || exit 1
unset HOSTSIM_STATE MESK_HOST_ROOT AUTOCLI_PLUGIN_PATH
# The copy's objects are the checkout's: the compiler cache finds them under the copy's path.
if command -v ccache >/dev/null; then
    export CMAKE_CXX_COMPILER_LAUNCHER=ccache CMAKE_C_COMPILER_LAUNCHER=ccache CCACHE_BASEDIR="$COPY"
fi

# The sh blocks of the README section headed $1, one command a line, comments dropped.
section_commands() {
    awk -v title="## $1" '
        /^## / { inside = ($0 == title) }
        inside && /^```sh$/ { block = 1; next }
        block && /^```$/ { block = 0; next }
        inside && block { sub(/ +# .*/, ""); print }' README.md
}

case_ "without root and without sudo, the set-up names what is missing and changes nothing"
FAKE="$E2E_DIR/fakebin"
mkdir -p "$FAKE"
printf '#!/bin/sh\necho 1000\n' >"$FAKE/id"
printf '#!/bin/sh\nexit 1\n' >"$FAKE/dpkg-query"
printf '#!/bin/sh\ntouch "%s/apt-get-ran"\n' "$E2E_DIR" >"$FAKE/apt-get"
chmod +x "$FAKE"/*
_capture env PATH="$FAKE" "$BASH" scripts/install-deps build
expect_rc 1
expect_err_has "apt-get install --no-install-recommends g++ cmake ninja-build"
expect_eq "$([ -e "$E2E_DIR/apt-get-ran" ] && echo ran)" "" "apt-get"

case_ "the first command builds, says so on stderr, and runs"
FIRST=$(sed -n '/^```sh$/{n;p;q}' README.md | sed 's/ *#.*//')
expect_eq "$FIRST" "./autocli mesk cluster get" "README's first command"
_capture bash -c "$FIRST"
expect_rc 1
expect_err_has "mesk: configuring"
expect_err_has "mesk: building ["
expect_err_has "Mesk Clustering is not enabled on this host"
_capture bash -c "$FIRST"
expect_err "Mesk Clustering is not enabled on this host"

case_ "a source edited since the last build is rebuilt before the command runs"
# A line on stderr from every load of the plug-in, then the source as it was.
SOURCE=registry/RegisterNamespaces.cpp
cp "$SOURCE" "$E2E_DIR/source"
printf '%s\n' '#include <cstdio>' \
    '[[maybe_unused]] static const int kEdited = std::fputs("edited\n", stderr);' >>"$SOURCE"
_capture bash -c "$FIRST"
expect_rc 1
expect_err_has "mesk: building ["
expect_err_has "edited"
cp "$E2E_DIR/source" "$SOURCE"
_capture bash -c "$FIRST"
expect_err_has "mesk: building ["
expect_eq "$(grep -c '^edited$' <<<"$ERR")" 0 "lines from the edit after it was undone"

case_ "./hostsim works on the host of ./autocli, .hostsim/ in the checkout"
_capture ./hostsim calls
expect_rc 0
expect_out_has '"op":"GetClusterConfig"'
expect_eq "$([ -f .hostsim/state.db ] && echo present)" present ".hostsim/state.db"
CONF=.hostsim/root/etc/orvane/mesk/mesktraced.conf
rm -f "$CONF"
_capture ./hostsim reset
expect_rc 0
expect_eq "$([ -f "$CONF" ] && echo present)" present "the host's files made again by ./hostsim reset"

case_ "an install with something unbuilt copies nothing"
rm build/platform/autocli/completions/bash/autocli
_capture cmake --install build --prefix "$E2E_DIR/partial"
expect_eq "$RC" 1 "exit status of cmake --install"
expect_err_has "run scripts/ensure-built first"
expect_eq "$([ -e "$E2E_DIR/partial" ] && echo copied)" "" "files copied"
./scripts/ensure-built 2>/dev/null

for section in "For scripts" "Install and package"; do
    COMMANDS=$(section_commands "$section")
    [ -n "$COMMANDS" ] || _fail "no commands in the section $section"
    while IFS= read -r command; do
        case_ "$section: $command"
        _capture bash -c "${command//\/opt\/mesk/$E2E_DIR/opt/mesk}"
        expect_rc 0
    done <<<"$COMMANDS"
done

case_ "the install holds what README says, and runs from there"
for path in bin/autocli bin/hostsim share/bash-completion/completions/autocli \
    share/zsh/vendor-completions/_autocli share/fish/vendor_completions.d/autocli.fish \
    share/man/man1/autocli-mesk.1.gz; do
    expect_eq "$([ -e "$E2E_DIR/opt/mesk/$path" ] && echo present)" present "$path"
done
_capture env HOSTSIM_STATE="$E2E_DIR/state.db" MESK_HOST_ROOT="$E2E_DIR/root" \
    "$E2E_DIR/opt/mesk/bin/autocli" mesk datastore name get --formatter json
expect_out '{"Name":"meskDatastore"}'
expect_eq "$(ls build/mesk_*.deb build/mesk-dbgsym_*.ddeb | wc -l)" 2 "packages in build/"

finish
