# A clean Debian in a folder, booted as a container. To be sourced; sets root (its folder) and work (for what the test
# notes).
work=$(mktemp -d)
root=$work/root
container=
leader=

require() {
    local missing=() package status
    for package in "$@"; do
        status=$(dpkg-query -W -f '${db:Status-Status}' "$package" 2>/dev/null || true)
        [ "$status" = installed ] || missing+=("$package")
    done
    [ ${#missing[@]} -eq 0 ] ||
        DEBIAN_FRONTEND=noninteractive apt-get install -y -qq --no-install-recommends "${missing[@]}" </dev/null
}

make_root() {  # of this machine's release, from this machine's archive
    [ "$(id -u)" -eq 0 ] || { echo "a container needs root" >&2; exit 1; }
    require mmdebstrap systemd-container util-linux curl python3
    local release
    release=$(. /etc/os-release && echo "$VERSION_CODENAME")
    # tzdata: every Debian has it, and apt removes it from none.
    mmdebstrap --quiet --variant=apt --include=systemd,systemd-sysv,dbus,procps,tzdata "$release" "$root" \
        $(find /etc/apt -name '*.sources' -o -name 'sources.list' -type f)
    cp /etc/apt/apt.conf.d/* "$root/etc/apt/apt.conf.d/"
    mkdir "$root/packages"
    cp "$packages"/*.deb "$root/packages/"
}

boot() {
    # A time zone that is mounted into it could not be replaced by the package of zones.
    systemd-nspawn --quiet --register=no --keep-unit -D "$root" --boot --kill-signal=SIGRTMIN+3 --console=pipe \
        --timezone=off </dev/null >>"$work/console" 2>&1 &
    container=$!
    for _ in $(seq 300); do
        leader=$(pgrep -P "$container" -x systemd || true)
        if [ -n "$leader" ] && inside "systemctl is-system-running" 2>/dev/null | grep -qE 'running|degraded'; then
            # The container's own boot id is mounted over the kernel's, and a service with a sandbox sees the latter. A
            # machine has only one.
            inside "while umount -l /proc/sys/kernel/random/boot_id 2>/dev/null; do :; done"
            return
        fi
        sleep 0.1
    done
    echo "the container does not boot" >&2
    tail "$work/console" >&2
    exit 1
}

shut_down() {
    [ -n "$container" ] || return 0
    kill -TERM "$container" 2>/dev/null || true
    for _ in $(seq 200); do kill -0 "$container" 2>/dev/null || break; sleep 0.1; done
    kill -KILL "$container" 2>/dev/null || true
    wait "$container" 2>/dev/null || true
    container=
}

enter() {
    nsenter -t "$leader" -a -- \
        env -i PATH=/usr/sbin:/usr/bin:/sbin:/bin DEBIAN_FRONTEND=noninteractive LC_ALL=C.UTF-8 "$@"
}
inside() { enter bash -c "$1"; }
spawn_inside() { enter "$@" </dev/null 2>/dev/null & }

# Settings of the service that hold until the next call; empty for none.
drop_in() {
    inside "mkdir -p /run/systemd/system/vantor-pim-sync.service.d &&
        printf '[Service]\n$1\n' >/run/systemd/system/vantor-pim-sync.service.d/test.conf && systemctl daemon-reload"
}

# Every file of the system, without what packaging, logging and running leave by themselves.
files() {
    (cd "$root" && find . -xdev \( -path ./proc -o -path ./sys -o -path ./dev -o -path ./run -o -path ./packages \
        -o -path ./var/cache -o -path ./var/log -o -path ./var/lib/apt -o -path ./var/lib/dpkg \
        -o -path ./var/lib/systemd -o -path ./root -o -path ./var/tmp -o -path ./tmp/systemd-private-\* \) -prune \
        -o -printf '%p %U:%G %m\n' | sort)
    (cd "$root" && sort etc/passwd etc/group | grep -v '^alice\|^bob')
}

clean_up() {
    shut_down
    rm -rf --one-file-system "$work"
}
trap clean_up EXIT
