# What the scripts share that make root file systems of Debian and keep them in the cache. Sourced with `step`
# set: each step of ./check has a folder of its own there.
set -euo pipefail

tree=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
source "$tree/Scripts/common.sh"
cache=${XDG_CACHE_HOME:-${HOME:=/root}/.cache}/dspdll/$step
export HOME

# The Debian mirror and release this machine is set up for, so that no host is named here.
debian_archive() {
    apt-get indextargets --format '$(ORIGIN) $(COMPONENT) $(CODENAME) $(REPO_URI)' 'Created-By: Packages' |
        awk '$1 == "Debian" && $2 == "main" && $3 !~ /-/ && !seen++ { print $4, $3 }'
}

# apt with lists and downloads of its own in the current folder, of packages (deb) or sources (deb-src): the
# system's stay as they are.
own_lists() {
    local mirror release
    read -r mirror release < <(debian_archive)
    mkdir -p lists/partial cache/archives/partial
    echo "$1 $mirror $release main" > sources.list
}
own_apt() {
    apt-get -qq -o Dir::Etc::sourcelist="$PWD/sources.list" -o Dir::Etc::sourceparts=/dev/null \
        -o Dir::State::Lists="$PWD/lists" -o Dir::Cache="$PWD/cache" -o APT::Sandbox::User=root "$@"
}

# debootstrap and the apt in a root take the machine's proxy from the environment.
export_apt_proxy() {
    eval "$(apt-config shell http_proxy Acquire::http::Proxy)"
    if [ -n "${http_proxy:-}" ]; then export http_proxy; fi
}

# place_of KIND RECIPE...: the folder is named after the scripts that make it, so that it is made anew when
# they change and trees at different states do not disturb each other.
place_of() {
    local kind=$1
    shift
    echo "$cache/$kind-$(cat "$@" | sha256sum | cut -c1-12)"
}

# Removes what earlier recipes made, unless it was used lately by another tree.
remove_older() {
    find "$cache" -maxdepth 1 -name "$1-*" ! -path "$2" -mtime +14 -exec rm -rf --one-file-system {} +
}
