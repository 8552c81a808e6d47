# A small Debian system with the package, made an image by the commands of olmboot-image(7), which boots in
# a container. To be sourced after common.sh and data.sh. Only root can use it.
# shellcheck shell=bash disable=SC2034,SC2154

[ "$(id -u)" = 0 ] || fail "containers are booted by root alone; run as root"
need_packages systemd-container
systemd-nspawn -q -D / --volatile=yes --register=no --keep-unit true >"$log" 2>&1 ||
  fail "containers can't start here: $(tail -n 1 "$log")"
need_packages build-essential cmake debhelper icu-devtools libc-bin libicu-dev mandoc mmdebstrap tzdata

# Makes the system, and names it in $device. The pages' download lies where its downloader has it, in $new.
make_device() {
  build_package
  device=$TMPDIR/device
  quietly "Making a Debian system" mmdebstrap --variant=minbase \
    --include=dbus,systemd,systemd-sysv,tzdata \
    "$(. /etc/os-release && echo "$VERSION_CODENAME")" "$device"
  mkdir -p "$device/etc/systemd/system/graphical.target.wants"
  cat >"$device/etc/systemd/system/check.service" <<'UNIT'
[Unit]
After=multi-user.target
[Service]
Type=oneshot
ExecStart=/bin/sh -c "bash /check >/report 2>&1"
ExecStopPost=/bin/systemctl poweroff --no-block
UNIT
  ln -s ../check.service "$device/etc/systemd/system/graphical.target.wants"
  g++ -std=c++17 -o "$TMPDIR/icu_clock" "$project/tools/icu_clock.cc" -licui18n -licuuc
  root=$device add_program "$TMPDIR/icu_clock" /bin/icu_clock

  download=2025b.1.0
  new=$device/home/downloader/$download
  chroot "$device" useradd -m downloader
  compile_tree "$new/zoneinfo" 2025b
  compile_icu "$new/icutz" 2025b 44l
  (cd "$new" && find . -type f -exec sha256sum {} +) >"$device/root/$download.sum"
  chroot "$device" chown -R downloader /home/downloader
  chmod -R go= "$new"

  cp "$package" "$device/root"
  quietly "Installing the package" chroot "$device" dpkg -i "/root/${package##*/}"
}

# Makes an image of the device, whose tree counts as that of release 2025a, older than the download.
make_image() {
  in_image "$device" 'cp -al'
  in_image "$device" America/Los_Angeles
  echo 2025a >"$device/usr/share/zoneinfo.default/+VERSION"
}

# Boots the device until it has done the commands $1, and prints what these print.
run_device() {
  local status=0
  printf '%s\n' "$1" 'echo end' >"$device/check"
  : >"$device/report"
  # A container whose first process hangs ends at a second SIGTERM.
  timeout --foreground 130 timeout --foreground 120 systemd-nspawn -q -M "olmboot-$$" -D "$device" --boot \
    --register=no --keep-unit --private-network --timezone=off </dev/null >"$log" 2>&1 || status=$?
  [ $status = 0 ] || fail "a boot failed or took 120 s (status $status): $(tail -n 1 "$log")"
  [ "$(tail -n 1 "$device/report")" = end ] ||
    fail "a boot's commands didn't end: $(tail -n 3 "$device/report")"
  sed '$d' "$device/report"
}
