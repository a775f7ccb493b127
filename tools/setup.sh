# Sourced by the scripts of the top folder: what they share in setting up a Debian machine.

# as_root COMMAND...: as it is for root, through sudo for others.
as_root() {
  if ((EUID == 0)); then "$@"; else sudo "$@"; fi
}

# missing_packages PACKAGE...: prints those that are not installed, one a line.
missing_packages() {
  local package
  for package; do
    [[ $(dpkg-query -W -f '${db:Status-Status}' "$package" 2>/dev/null) == installed ]] || echo "$package"
  done
}

# install_packages PACKAGE...: installs those that are missing, and says so on standard error. On a machine without
# apt-get they count as there.
install_packages() {
  command -v apt-get >/dev/null || return 0
  local missing
  mapfile -t missing < <(missing_packages "$@")
  ((${#missing[@]})) || return 0
  if ((EUID != 0)) && ! command -v sudo >/dev/null; then
    echo "Packages are missing, and neither root nor sudo is at hand. Run as root: apt-get install ${missing[*]}" >&2
    return 1
  fi
  echo "Installing ${missing[*]} ..." >&2
  local log
  log=$(mktemp)
  if ! { as_root apt-get update -q &&
    as_root env DEBIAN_FRONTEND=noninteractive apt-get install -q -y --no-install-recommends "${missing[@]}"; } \
    >"$log" 2>&1; then
    tail -n 20 "$log" >&2
    rm -f "$log"
    echo "Could not install ${missing[*]}" >&2
    return 1
  fi
  rm -f "$log"
}
