#!/bin/bash
# Full disks and kills on each kind of file system that a configuration directory is likely to lie on.
#
#   file_systems.sh DRIVER
set -euo pipefail

driver=$1
configDir=/usr/vork/etc/fileindex

# Saves until the disk is full need a small one, kills one with room.
on_tmpfs() {
    mount -n -t tmpfs -o "size=$1" tmpfs "$configDir"
}

# On the machine's own disk, so that a flush is one.
image=${BUILD_DIR:-/tmp}/reliability-ext4.img
on_ext4() {
    truncate -s "$1" "$image"
    mkfs.ext4 -q -F "$image"
    mount -n -o loop "$image" "$configDir"
}
trap 'rm -f "$image"' EXIT

for fileSystem in tmpfs ext4; do
    for scenario in full-disk kills cost; do
        size=4M
        [[ $scenario == full-disk ]] || size=64M
        "on_$fileSystem" "$size"
        "$driver" "$scenario" "$fileSystem"
        umount -n "$configDir"
    done
done
