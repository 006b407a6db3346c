#!/bin/bash
# Every system call of every changing operation fails once: never is anything lost, left locked or left open, and a
# failure has its code or record. Which, for each call of the library itself, says tests/unit/failures.txt.
#
#   system_calls.sh DRIVER
#
# FILEINDEX_TORTURE=long takes all operations and errors, otherwise a few.
set -euo pipefail

driver=$1
trace=/tmp/trace

# System calls and the errors they are made to fail with; the first one alone in the short run.
declare -A errors=(
    [openat]="EACCES EMFILE"
    [newfstatat]="EACCES EIO"
    [flock]="ENOLCK EINTR"
    [read]="EIO EINTR"
    [pread64]="EIO EINTR"
    [write]="EIO ENOSPC EINTR"
    [fdatasync]="EIO EINTR ENOSYS"
    [fsync]="EIO EINTR EINVAL"
    [socket]="EMFILE"
    [connect]="ECONNREFUSED EAGAIN"
    [mmap]="ENOMEM"
    [brk]="0" # the kernel's way of refusing
    [clone3]="EAGAIN ENOSYS"
    [wait4]="ECHILD EINTR"
    [poll]="EINTR EIO"
)

fail() {
    printf 'FAILED: %s\n' "$@" >&2
    exit 1
}

# The calls of the operation, those between the two marks: name and number in the process.
marked_calls() {
    awk '/^getppid/ { ++mark; next }
         /^[a-z]/   { name = $0; sub(/\(.*/, "", name); ++count[name]; if (mark == 1) print name, count[name] }' "$trace"
}

# A daemon that cannot be told leaves no record here.
silent='^share-(pause|resume) (clock_gettime|socket|connect|setsockopt|write)\('

# Holds of every outcome: no half change, nothing kept, and no failure without its code or record. A close that is made
# to fail is not done: the descriptor stays, and what it locks.
check_outcome() {
    local call=$1 outcome=$2
    [[ $outcome =~ ' folders='(old|new)' status='(old|new)' queue=whole locks=free ' ]] || fail "$call" "$outcome"
    [[ $outcome =~ ^(true|false\ [1-9]|false\ 0.*\;) || $call =~ $silent ]] || fail "$call" "$outcome"
    [[ $call == *" close("* || $outcome == *" descriptors=same repeated=true"* ]] || fail "$call" "$outcome"
}

fail_call() {
    local operation=$1 name=$2 number=$3 fault=error=$4 call outcome status=0
    [[ $fault != error=0 ]] || fault=retval=0
    outcome=$(timeout -s KILL 60 strace -y -o "$trace" -e "inject=$name:$fault:when=$number" \
        "$driver" operation "$operation" 2>&1) || status=$?
    call=$(awk '/^getppid/ { ++mark } mark == 1 && /INJECTED/' "$trace")
    if [[ -z $call ]]; then
        missed=$((missed + 1)) # another number of calls than the last time
        return
    fi
    [[ $status -eq 0 ]] || fail "status $status: $operation $call" "$outcome"
    check_outcome "$operation $call" "$outcome"
    faults=$((faults + 1))
}

fail_each_call() {
    local operation=$1 call error calls
    "$driver" operation "$operation" >/dev/null # what only the first run does is done
    strace -y -o "$trace" "$driver" operation "$operation" >/dev/null
    awk '/^getppid/ { ++mark } mark == 1 && /^(openat|socket|pipe2?|dup|accept4?|memfd_create)\(/ && !/CLOEXEC| = -1 /' \
        "$trace" >/tmp/inherited
    [[ ! -s /tmp/inherited ]] || fail "descriptors that survive an exec:" "$(</tmp/inherited)"
    [[ " $chosen " == *" $operation "* ]] || return 0
    mapfile -t calls < <(marked_calls)
    for call in "${calls[@]}"; do
        for error in $(chosen_errors "${call% *}"); do
            fail_call "$operation" "${call% *}" "${call#* }" "$error"
        done
    done
}

chosen_errors() {
    local all=${errors[$1]-EIO}
    if [[ $long ]]; then
        echo "$all"
    else
        echo "${all%% *}"
    fi
}

skip() {
    printf 'skipped: %s\n' "$*"
    exit 77
}

command -v strace >/dev/null || fail "strace is missing"
strace -o /dev/null true 2>/dev/null || skip "no process may be traced here"
[[ -z ${SANITIZE-} ]] || skip "a sanitizer's own system calls are not to fail"
# Starting a service also turns its boot links on, by a slow script that is no part of what is tested.
[[ ! -e /usr/sbin/update-rc.d ]] || mount -n --bind /bin/true /usr/sbin/update-rc.d

operations=$("$driver" operations | tr '\n' ' ')
chosen="first-marker updated upsert"
long=
if [[ ${FILEINDEX_TORTURE-} == long ]]; then
    chosen=$operations
    long=yes
fi
faults=0
missed=0
for operation in $operations; do
    fail_each_call "$operation"
done
[[ $missed -le $((faults / 50)) ]] || fail "$missed of $((faults + missed)) calls were not met"
echo "figure: each system call fails once, $(wc -w <<<"$chosen") operations | $faults faults:" \
    "0 crashes, 0 hangs, nothing lost, locks free, repeatable ($missed not met)"
echo "figure: descriptors that survive an exec, $(wc -w <<<"$operations") operations | 0"
