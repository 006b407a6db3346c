#!/bin/bash
# Full disks and kills on each kind of file system that a configuration directory is likely to lie on.
#
#   file_systems.sh DRIVER
set -euo pipefail

driver=$1
configDir=/usr/vork/etc/fileindex
image=${BUILD_DIR:-/tmp}/reliability-ext4.img # on the machine's own disk, so that a flush is one
trap 'rm -f "$image"' EXIT

# run_on_both SCENARIO SIZE
run_on_both() {
    mount -n -t tmpfs -o "size=$2" tmpfs "$configDir"
    "$driver" "$1" tmpfs
    umount -n "$configDir"

    truncate -s "$2" "$image"
    mkfs.ext4 -q -F "$image"
    mount -n -o loop "$image" "$configDir"
    "$driver" "$1" ext4
    umount -n "$configDir"
}

# Saves until the disk is full need a small one.
run_on_both full-disk 4M
run_on_both writers 64M
