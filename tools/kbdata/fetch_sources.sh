#!/bin/sh
# Brings the pinned public sources of the default knowledge base into DIR, for gen_kb.py.
#
#   tools/kbdata/fetch_sources.sh [--mirror MIRRORS] DIR
#
# npm packages come through `npm pack`; GitHub repositories are cloned, or read from local
# git mirrors (MIRRORS/OWNER+NAME/repo or MIRRORS/OWNER+NAME.git). Versions are those of
# kb/CREDITS.md: change both together. Nothing is written into the repository.
set -eu

APPLE_REPO=apple/password-manager-resources
APPLE_COMMIT=96cbab74681dcc296cae6fb205c4b047bc026c22
POLKADOT_REPO=polkadot-js/phishing
POLKADOT_COMMIT=f35b682cca80e6a406da6acf298957e4f283a322
NPM_PACKAGES="top-sites@1.1.222 simple-icons@16.37.0 auth0-lock@14.3.0 eth-phishing-detect@1.2.0"

mirror=""
if [ "${1:-}" = "--mirror" ]; then
  mirror=$2
  shift 2
fi
[ $# -eq 1 ] || { echo "usage: $0 [--mirror MIRRORS] DIR" >&2; exit 64; }
out=$1
mkdir -p "$out"

# git_file REPO COMMIT PATH DEST: one file of a repository at a commit.
git_file() {
  repo=$1 commit=$2 path=$3 dest=$4
  gitdir=""
  if [ -n "$mirror" ]; then
    name=$(echo "$repo" | tr / +)
    for candidate in "$mirror/$name/repo" "$mirror/$name.git" "$mirror/$name"; do
      if [ -d "$candidate" ]; then gitdir=$candidate; break; fi
    done
  fi
  if [ -z "$gitdir" ]; then
    gitdir="$out/.git-$(echo "$repo" | tr / +)"
    if [ ! -d "$gitdir" ]; then
      git clone --quiet --bare "https://github.com/$repo.git" "$gitdir"
    fi
  fi
  mkdir -p "$(dirname "$dest")"
  git --git-dir="$gitdir" show "$commit:$path" > "$dest"
}

git_file "$APPLE_REPO" "$APPLE_COMMIT" quirks/shared-credentials.json \
  "$out/password-manager-resources/quirks/shared-credentials.json"
git_file "$POLKADOT_REPO" "$POLKADOT_COMMIT" all.json "$out/polkadot-phishing/all.json"

for package in $NPM_PACKAGES; do
  name=${package%@*}
  tarball=$(cd "$out" && npm pack --silent "$package" | tail -n 1)
  rm -rf "${out:?}/$name"
  mkdir -p "$out/$name"
  tar -xzf "$out/$tarball" -C "$out/$name"
  rm -f "$out/$tarball"
done
echo "sources in $out"
