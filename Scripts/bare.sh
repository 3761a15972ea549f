#!/usr/bin/env bash
# Runs the README's two commands on a bare Debian, each in a minimal root of its own with nothing else
# installed: so what a script uses and does not install is found. ./check bare
# Tests what is committed. The minimal root and the packages that were downloaded are kept in the cache.
step=bare
source "$(dirname "$0")/roots-common.sh"

# The step cannot be done on this machine, which is no fault of the tree.
skip() {
    echo "bare: skipped: $*"
    exit 0
}

[ "$(id -u)" = 0 ] || skip "needs root (packages, and a root of Debian)"
need_packages ccache debootstrap git util-linux || skip "packages are missing and could not be installed (no network?)"
git -C "$tree" rev-parse --quiet --verify HEAD >/dev/null || skip "the tree is no clone"

mkdir -p "$cache/packages" "$cache/root"
minimal=$(place_of minimal "$0").tar
compiled=$(ccache -k cache_dir)
mkdir -p "$compiled"
export tree cache minimal compiled root=$cache/root

# One run at a time. The lock goes on to all that is started here.
exec 8> "$cache/lock"
flock 8

# alone FUNCTION [ARGUMENT...]: runs it with a root in memory, mounts and processes of its own; nothing of them
# is left when it ends or this script does, in whatever way. As a background job, since bash acts on an
# interruption only after a job in the foreground.
trap 'exit 130' INT
alone() {
    setpriv --pdeathsig KILL unshare --mount-proc --pid --fork --kill-child bash -euo pipefail -c '
        mount -t tmpfs -o size=4g,mode=755 tmpfs "$root"
        "$@"' bash "$@" &
    wait $!
}

make_minimal() {
    debootstrap --variant=minbase "$release" "$root" "$mirror"
    rm -f "$root"/var/cache/apt/archives/*.deb
    tar -C "$root" -cf "$minimal.part" .
    mv "$minimal.part" "$minimal"
}

# So that objects compiled outside are found, the tree stands at its own place inside as well, the compiler cache
# has its place and settings, and the language is the same, which the cache takes for a part of the compiler.
run_inside() {
    tar -C "$root" -xf "$minimal"
    cp -L /etc/resolv.conf /etc/hosts "$root/etc"
    mkdir -p "$root$tree" "$root$compiled"
    git clone -q "$tree" "$root$tree"
    ccache -p | sed -n '/^(default)/! s/^([^)]*) //p' > "$root/etc/outer-ccache.conf"
    mount -t proc proc "$root/proc"
    mount --rbind /dev "$root/dev"
    mount --bind "$cache/packages" "$root/var/cache/apt/archives"
    mount --bind "$compiled" "$root$compiled"
    local language
    mapfile -t language < <(env | grep -E '^(LANG|LC_ALL|LC_CTYPE|LC_MESSAGES)=')
    env -i "${language[@]}" PATH=/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin HOME=/root \
        ${http_proxy:+"http_proxy=$http_proxy"} CCACHE_CONFIGPATH=/etc/outer-ccache.conf CCACHE_DIR="$compiled" \
        chroot "$root" "$tree/$1"
    chroot "$root" apt-get -qq autoclean
}

read -r mirror release < <(debian_archive) || skip "no Debian mirror is configured"
export_apt_proxy
answer=$(mktemp) status=
/usr/lib/apt/apt-helper -qq download-file "${mirror%/}/dists/$release/InRelease" "$answer" 2>/dev/null || status=$?
rm -f "$answer"
[ -z "$status" ] || skip "the Debian mirror cannot be reached"
export mirror release
export -f make_minimal run_inside

[ "$(awk '/^MemAvailable:/ { print $2 }' /proc/meminfo)" -gt 5000000 ] || skip "the root is in memory and needs 5 GB"
alone true || skip "this machine allows no mounts"
if ! [ -f "$minimal" ]; then
    say "making a minimal root ($release, kept in $cache)"
    alone make_minimal > "$cache/minimal.log" 2>&1 || {
        echo "bare: FAILED: the minimal root could not be made: $(tail -n 1 "$cache/minimal.log")"
        exit 1
    }
fi
touch "$minimal"
remove_older minimal "$minimal"

[ -z "$(git -C "$tree" status --porcelain)" ] || echo "bare: what is not committed is left out"

# Each command has a root of its own, and runs even when one before it failed, so that one run tells all.
failed=()
for command in demo check; do
    say "./$command on a bare $release"
    started=$SECONDS
    alone run_inside "$command" || failed+=("./$command")
    echo "bare: ./$command took $((SECONDS - started)) s"
done

[ ${#failed[@]} = 0 ] || {
    echo "bare: FAILED: ${failed[*]}"
    exit 1
}
