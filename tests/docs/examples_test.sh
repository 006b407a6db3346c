#!/bin/bash
# Each example prints what its last comment says.
set -euo pipefail

fresh_machine() {
    rm -rf /vol1/* /vol2/* /usr/vork/etc/* /tmp/fileidx_cfg_*.lock
    mkdir -p /usr/vork/etc/fileindex /vol1/photo/2015 /vol1/photo/2016 /vol1/photo/@eaDir /vol2/music
    echo '{"shares": {"photo": {"path": "/vol1/photo"}, "music": {"path": "/vol2/music"}}}' >/usr/vork/etc/platform.conf
    cat >/usr/vork/etc/fileindex/folder.conf <<'CONF'
{"/music/old": {"name": "Old records", "audio": true}, "/photo/2015": {"name": "Holiday", "photo": true}}
CONF
    echo '{"event":65536,"path":"/vol1/photo/2015","data":null}' >/vol1/photo/@eaDir/VORK@file_index_queue
}

# The daemon, started as a service is.
cat >/etc/init.d/fileindexd <<END
#!/bin/sh
[ "\$1" != start ] || [ -S /run/fileindexd.sock ] || "$BUILD_DIR/demo/fileindex_demo_peer" /tmp/commands /run/peer.pid
END
printf '#!/bin/sh\nexit 0\n' >/etc/init.d/smbd
chmod 755 /etc/init.d/fileindexd /etc/init.d/smbd
/etc/init.d/fileindexd start

failed=0
for source in "$SOURCE_DIR"/docs/examples/*.c*; do
    fresh_machine
    name=${source##*/}
    diff -u --label "$name says" --label "$name prints" \
        <(sed '1,/^\/\/ Output:$/d; s/^\/\/ //' "$source") <("$BUILD_DIR/examples/$name" 2>&1) || failed=1
done
exit "$failed"
