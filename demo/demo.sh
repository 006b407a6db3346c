#!/bin/bash
# Folders of two shares are put under the index, and what each party receives is shown and checked: the saved list,
# the file-change monitor, the services, the daemon's commands, the shares' event queues.
#
#   demo/demo.sh BUILD_DIRECTORY
#
# To be run through scripts/in-private-namespace ("./run demo" does): it writes to the library's fixed paths.
set -uo pipefail
export LC_ALL=C # lengths in bytes

here=$(dirname -- "$(realpath -- "${BASH_SOURCE[0]}")")
build=$(realpath -- "${1:?usage: demo.sh BUILD_DIRECTORY}")
ctl=$build/bin/fileindexctl

folderConf=/usr/vork/etc/fileindex/folder.conf
statusConf=/usr/vork/etc/fileindex/status.conf
platformConf=/usr/vork/etc/platform.conf
registrations=/usr/vork/etc/vorknotifyd/registrations.json
photoQueue=/vol1/photo/@eaDir/VORK@file_index_queue
documentsQueue=/vol1/documents/@eaDir/VORK@file_index_queue
frames=/run/frames-received
fileSharingCalls=/run/file-sharing-calls

# shellcheck source=demo/sample_files.sh
source "$here/sample_files.sh"
# shellcheck source=demo/report.sh
source "$here/report.sh"

# --- the machine -----------------------------------------------------------------------------------------------

make_volume() {
    if truncate -s 64M /tmp/volume.img && mkfs.ext4 -q /tmp/volume.img && mount -o loop /tmp/volume.img /vol1; then
        note "an ext4 volume on a loop device"
    else
        note "no loop device here: the volume stays in memory"
    fi 2>/dev/null
    df --output=source,fstype,size,target /vol1 | indent
}

make_shares() {
    mkdir -p "/vol1/photo/2015/a trip" /vol1/photo/private /vol1/documents/music
    make_jpeg /vol1/photo/2015/beach.jpg
    make_png "/vol1/photo/2015/a trip/map.png"
    make_mp4 "/vol1/photo/2015/a trip/waves.mp4"
    make_png /vol1/photo/private/passport.png
    make_text /vol1/documents/packing.txt
    make_pdf /vol1/documents/ticket.pdf
    make_wav /vol1/documents/music/silence.wav
    find /vol1 -type f -printf '%P (%s bytes)\n' | sort | indent

    cat >"$platformConf" <<'JSON'
{"shares": {"photo": {"path": "/vol1/photo"}, "documents": {"path": "/vol1/documents"}}, "search": false}
JSON
}

install_service() {
    local name=$1 template=$2 record=$3
    sed -e "s|@PEER@|'$build/demo/fileindex_demo_peer'|" -e "s|@RECORD@|$record|" "$here/$template" \
        >"/etc/init.d/$name"
    chmod +x "/etc/init.d/$name"
}

# --- the story -------------------------------------------------------------------------------------------------

heading "A machine with two shares"
make_volume
make_shares
install_service fileindexd fileindexd.init "$frames"
install_service smbd file_sharing.init "$fileSharingCalls"
note "and two services, none of them running:"
service fileindexd status | indent
check "fileindexd does not run yet" test ! -e /run/fileindexd.sock
check "nothing is indexed yet" test ! -e "$folderConf"
userFiles=$(find /vol1 -type f | wc -l)

heading "Add a folder of photos and films"
run_ctl add "/photo/2015" --name "Summer 2015" --media photo,video

show "folder.conf" "$folderConf"
check_json "the folder is saved" "$folderConf" '"/photo/2015":{"audio":false,"document":false,
    "name":"Summer 2015","path":"/photo/2015","photo":true,"video":true}'

show "the file-change monitor's registrations" "$registrations"
check_json "the folder is watched for changes, not for reads" "$registrations" '"mask":65486'
check_json "below its place on the volume" "$registrations" '"path":"/vol1/photo/2015"'
check_json "without the system's own directories" "$registrations" '"ignore":["@eaDir"]'
check_json "into the share's queue" "$registrations" "\"queue\":\"$photoQueue\""

note "the services:"
service fileindexd status | indent
check "the library started fileindexd" service fileindexd status
check "which listens" test -S /run/fileindexd.sock
show "what the file-sharing service was asked" "$fileSharingCalls"
check_json "the search setting is on" "$platformConf" '"search":true'
check "the file-sharing service was restarted for it" grep -qx restart "$fileSharingCalls"

expect_frames 1
check_frame "the daemon is told of the folder" \
    '{"data":{"folder_path":"/photo/2015"},"type":"upsert_folder_setting"}'

show "the queue of the share photo" "$photoQueue"
check_lines "it holds one event" 1 "$photoQueue"
check_json "settings changed (0x20000), for every kind of file: nothing governed them before" "$photoQueue" \
    '{"data":{"audio":true,"document":true,"photo":true,"video":true},"event":131072,"path":"/vol1/photo/2015"}'

heading "Add a whole share of documents"
run_ctl add /documents --media document
expect_frames 2
check_frame "the daemon is told of the share" '{"data":{"folder_path":"/documents"},"type":"upsert_folder_setting"}'
check_json "the share is watched" "$registrations" '"path":"/vol1/documents"'
show "the queue of the share documents" "$documentsQueue"
check_json "the event is in the queue of its own share" "$documentsQueue" '"event":131072,"path":"/vol1/documents"'
check_lines "and not in the other" 1 "$photoQueue"
check_lines "the file-sharing service was left alone this time" 1 "$fileSharingCalls"

heading "Change a folder: its music too"
run_ctl set /documents --media document,audio
expect_frames 3
show "the queue of the share documents" "$documentsQueue"
check_lines "one more event" 2 "$documentsQueue"
check_json "for what changed only" "$documentsQueue" '{"data":{"audio":true,"document":false,"photo":false,
    "video":false},"event":131072,"path":"/vol1/documents"}'
check_json "both kinds are saved" "$folderConf" '"/documents":{"audio":true,"document":true'

heading "Ask"
run_ctl list
run_ctl show /photo/2015
run_ctl check "/photo/2015/a trip/map.png"
run_ctl check "/vol1/documents/music/silence.wav"
refuse_ctl 1 check /photo/private/passport.png
refuse_ctl 64 add /photo/2015
refuse_ctl 66 show /photo/private
check_lines "questions and refusals told the daemon nothing" 3 "$frames"

heading "Pause for the night, and go on"
run_ctl pause 8h
expect_frames 4
show "status.conf" "$statusConf"
resumeTime=$(sed -n 's/.*"resume_time" *: *\([0-9]*\).*/\1/p' "$statusConf")
check "the pause ends in eight hours" test "$((resumeTime - $(date +%s) - 8 * 3600))" -ge -60 -a \
    "$((resumeTime - $(date +%s) - 8 * 3600))" -le 0
check_frame "the daemon is told the same time" "{\"data\":{\"resume_time\":$resumeTime},\"type\":\"pause\"}"
run_ctl resume
expect_frames 5
check_frame "the daemon is told to go on" '{"data":{},"type":"resume"}'
check_json "and nothing is paused in status.conf" "$statusConf" '{"resume_time":-1}'

heading "How far it has got, and once more from the start"
run_ctl list --status
check "work waits in both queues" test "$("$ctl" list --status | grep -c processing)" -eq 2
run_ctl reindex /photo/2015
check_json "a reindex (0x10000) is queued" "$photoQueue" '"event":65536,"path":"/vol1/photo/2015"'
run_ctl pause
expect_frames 6
check "paused folders say so" test "$("$ctl" list --status | grep -c paused)" -eq 2
run_ctl resume
expect_frames 7

heading "The share photo gets another name"
mv /vol1/photo /vol1/pictures
sed -i -e 's|/vol1/photo|/vol1/pictures|' -e 's|"photo"|"pictures"|' "$platformConf"
run_ctl share rename photo pictures
check_json "its folder follows" "$folderConf" '"path":"/pictures/2015"'
check_json "and is watched in its new place" "$registrations" '"path":"/vol1/pictures/2015"'
check "the old place is not watched any more" bash -c "! grep -q /vol1/photo '$registrations'"

heading "Remove a folder, then the last one"
run_ctl remove /documents --yes
expect_frames 8
check_frame "the daemon is told" '{"data":{"folder_path":"/documents"},"type":"delete_folder_setting"}'
check "the index data of its share is gone" test ! -e "$documentsQueue"
check "the users' files are not" test -e /vol1/documents/ticket.pdf
run_ctl remove /pictures/2015 --yes
check "nothing is indexed" grep -qx '{}' "$folderConf"
check "fileindexd is stopped" bash -c '! service fileindexd status'
check_json "the search setting is off" "$platformConf" '"search":false'
check "no queue and no database is left" test -z "$(find /vol1 -name 'VORK@*')"
check "nothing is watched" bash -c "! grep -q /vol1 '$registrations'"
check "every file of the users is still there" test "$(find /vol1 -type f | wc -l)" -eq "$userFiles"

heading "Everything the daemon received"
show "length and text of each frame" "$frames"
check "every length is that of its text and the final NUL" lengths_are_right "$frames"

conclude
