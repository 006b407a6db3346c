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

on_ext4() {
    truncate -s "$1" /tmp/disk.img
    mkfs.ext4 -q -F /tmp/disk.img
    mount -n -o loop /tmp/disk.img "$configDir"
}

for fileSystem in tmpfs ext4; do
    for scenario in full-disk kills; do
        size=4M
        [[ $scenario == full-disk ]] || size=64M
        "on_$fileSystem" "$size"
        "$driver" "$scenario" "$fileSystem"
        umount -n "$configDir"
    done
done
