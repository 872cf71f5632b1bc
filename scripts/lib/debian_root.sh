# Sourced by scripts that install a Debian release in a folder and run commands there in a chroot. They define fail and
# cannot, which take a text, and set
#   release   the code name of the release
#   folder    where the list of archives and the mark of a complete installation are
#   root      where the release is installed
#   log       the file for the output of commands
# The release comes from the mirror in the apt sources of this machine, with its proxies and keys.

# enter_mount_namespace ARGUMENT...: starts the script again, with these arguments, in a mount namespace of its own, in
# which its mounts end with it, however it ends
enter_mount_namespace() {
  [ "${HAS_MOUNT_NAMESPACE-}" != "$$" ] || return 0
  unshare --mount true 2>/dev/null || cannot "mounts are not permitted here (unshare --mount fails)"
  HAS_MOUNT_NAMESPACE=$$ exec unshare --mount "$0" "$@"
}

# quietly COMMAND...: appends the output of the command to the log, and shows the end of the log if the command fails
quietly() {
  "$@" >>"$log" 2>&1 || { tail -n 20 "$log" >&2; fail "'$1' failed; see $log"; }
}

# The Debian archives of this machine, as apt reads them: the URI and the code name of each.
archives_here() {
  apt-get indextargets --format '$(REPO_URI) $(CODENAME)' \
    'Created-By: Packages' 'Origin: Debian' 'Component: main' | sort -u
}

release_here() { (. /etc/os-release && echo "${VERSION_CODENAME-}"); }

# The same archives of the release: bookworm-security becomes trixie-security.
archives_there() {
  local here
  here=$(release_here)
  [ -n "$(archives_here)" ] || quietly apt-get update
  archives_here | sed -n "s/ $here\(-[a-z]*\)\?\$/ $release\1/p"
}

# in_release COMMAND...: runs the command in the chroot, with nothing of this environment but its proxies
in_release() {
  local variables=(PATH=/usr/sbin:/usr/bin:/sbin:/bin HOME=/root LANG=C.UTF-8 TERM="${TERM-dumb}") name
  for name in http_proxy https_proxy no_proxy; do
    [ -z "${!name-}" ] || variables+=("$name=${!name}")
  done
  chroot "$root" env -i "${variables[@]}" "$@"
}

# What the release needs to know of this machine: its names, its name servers, and how apt reaches the mirror.
copy_settings() {
  local file
  mkdir -p "$root/etc/ssl/certs"
  for file in /etc/hosts /etc/resolv.conf /etc/apt/auth.conf /etc/ssl/certs/ca-certificates.crt; do
    [ ! -e "$file" ] || cp -L "$file" "$root$file"
  done
  for file in /etc/apt/auth.conf.d /etc/apt/keyrings /etc/apt/trusted.gpg.d; do
    [ ! -d "$file" ] || cp -RL "$file" "$root/etc/apt/"
  done
  apt-config dump | grep '^Acquire::' | grep -vE '^Acquire::(IndexTargets|CompressionTypes|Changelogs)' \
    >"$root/etc/apt/apt.conf.d/50host"
  sed 's/^/deb /; s/$/ main/' "$folder/archives" >"$root/etc/apt/sources.list"
}

# What saves time in a system that is deleted rather than repaired, and keeps its services from starting.
spare_work() {
  echo force-unsafe-io >"$root/etc/dpkg/dpkg.cfg.d/unsafe-io"
  printf 'path-exclude=/usr/share/%s/*\n' doc man locale >"$root/etc/dpkg/dpkg.cfg.d/no-documents"
  printf '#!/bin/sh\nexit 101\n' >"$root/usr/sbin/policy-rc.d"
  chmod +x "$root/usr/sbin/policy-rc.d"
}

# Installs the smallest system of the release, unless it is installed.
install_release() {
  local mirror proxy
  [ ! -e "$folder/installed" ] || return 0
  archives_there >"$folder/archives"
  mirror=$(sed -n "s/ $release\$//p" "$folder/archives" | head -n 1)
  [ -n "$mirror" ] || fail "the apt sources of this machine name no Debian mirror"
  /usr/lib/apt/apt-helper download-file "${mirror%/}/dists/$release/InRelease" "$folder/InRelease" >>"$log" 2>&1 ||
    { tail -n 3 "$log" >&2; cannot "the mirror $mirror has no release '$release'"; }
  if ! command -v debootstrap >/dev/null; then
    quietly apt-get update
    quietly apt-get install -y --no-install-recommends debootstrap
  fi
  eval "$(apt-config shell proxy Acquire::http::Proxy)"
  [ -z "${proxy-}" ] || export http_proxy=$proxy https_proxy=${https_proxy-$proxy}
  rm -rf --one-file-system "$root"
  DPKG_FORCE=unsafe-io quietly debootstrap --variant=minbase "$release" "$root" "$mirror"
  copy_settings
  spare_work
  quietly in_release apt-get update
  quietly in_release apt-get dist-upgrade -y
  touch "$folder/installed"
}

# mount_system: the devices, processes and settings of this machine in the chroot
mount_system() {
  local name
  for name in dev proc sys; do
    mount --rbind "/$name" "$root/$name"
  done
}
