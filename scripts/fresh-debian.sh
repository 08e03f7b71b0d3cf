#!/usr/bin/env bash
# Checks that the README's two commands work on a fresh Debian 12 machine: makes a minimal
# bookworm root with debootstrap (variant minbase, nothing added), clones the committed HEAD of
# this checkout into it (nothing beside the clone: the test data is part of the repository), and
# runs scripts/format-sample.sh and then scripts/test.sh in it as root through chroot. Prints
# PASS or FAIL for each and exits non-zero when one fails.
# Usage (as root): fresh-debian.sh [--worktree] [WORK_DIR]
#   --worktree  also copy the checkout's uncommitted changes and new files into the clone
#   WORK_DIR    default build-infra/fresh-debian in the checkout. The pristine root is kept
#               there as a tarball and downloaded packages in apt-archives/, so a second run
#               skips debootstrap and the downloads (the packages are still installed afresh).
set -euo pipefail
repo=$(cd "$(dirname "$0")/.." && pwd)
worktree=false
if [ "${1:-}" = --worktree ]; then worktree=true; shift; fi
mkdir -p "${1:-$repo/build-infra/fresh-debian}"
work=$(cd "${1:-$repo/build-infra/fresh-debian}" && pwd)
root=$work/root
tarball=$work/bookworm-minbase.tar
mirror=http://deb.debian.org/debian

# Mount points at or below the root, deepest first.
mounts_below_root() {
    awk -v r="$root" '$2 == r || index($2, r "/") == 1 {print $2}' /proc/self/mounts | sort -r
}
unmount_all() {
    mounts_below_root | while read -r point; do umount -l "$point"; done
}
trap unmount_all EXIT

if [ ! -f "$tarball" ]; then
    if ! command -v debootstrap >/dev/null; then
        apt-get update -qq
        DEBIAN_FRONTEND=noninteractive apt-get install -y -qq --no-install-recommends debootstrap
    fi
    rm -rf --one-file-system "$work/pristine"
    echo "== debootstrap bookworm (minbase)"
    debootstrap --variant=minbase bookworm "$work/pristine" "$mirror" >"$work/debootstrap.log"
    # The sources of a standard installation: the release, its updates and security updates.
    cat >"$work/pristine/etc/apt/sources.list" <<EOF
deb $mirror bookworm main
deb $mirror bookworm-updates main
deb http://deb.debian.org/debian-security bookworm-security main
EOF
    tar -C "$work/pristine" -cf "$tarball.part" . && mv "$tarball.part" "$tarball"
    rm -rf --one-file-system "$work/pristine"
fi

unmount_all
if [ -n "$(mounts_below_root)" ]; then
    echo "still mounted below $root: not removing it" >&2
    exit 1
fi
rm -rf --one-file-system "$root"
mkdir -p "$root" "$work/apt-archives/partial"
tar -C "$root" -xf "$tarball"
cp /etc/resolv.conf "$root/etc/resolv.conf"

git clone --quiet --no-hardlinks "$repo" "$root/src/jsonvalue"
if $worktree; then
    git -C "$repo" ls-files -z --modified --others --exclude-standard |
        tar -C "$repo" --null --ignore-failed-read -T - -cf - | tar -C "$root/src/jsonvalue" -xf -
fi
echo "== testing $(git -C "$root/src/jsonvalue" log -1 --format='%h %s')$($worktree && echo ' with uncommitted changes')"

mount -t proc proc "$root/proc"
mount -t sysfs sysfs "$root/sys"
mount --rbind /dev "$root/dev"
mount --make-rslave "$root/dev"
mount --bind "$work/apt-archives" "$root/var/cache/apt/archives"

failed=0
summary=()
for command in scripts/format-sample.sh scripts/test.sh; do
    echo "== $command"
    start=$SECONDS
    if chroot "$root" /usr/bin/env -i HOME=/root TERM=dumb \
        PATH=/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin \
        bash -c "cd /src/jsonvalue && $command"; then
        result=PASS
    else
        result=FAIL
        failed=1
    fi
    summary+=("$result $command ($((SECONDS - start)) s)")
    echo "${summary[-1]}"
done
printf '%s\n' "== summary" "${summary[@]}"
exit "$failed"
