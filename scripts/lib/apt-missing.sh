# Sourced by the set-up scripts. install_missing PACKAGE... installs, from
# Debian's archive, those of the packages that are not installed yet, so a
# second run costs nothing. Before installing it runs the function
# before_install when the caller defines one (to add a foreign architecture).

install_missing() {
    local missing=() p
    for p in "$@"; do
        if ! dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed'; then
            missing+=("$p")
        fi
    done
    [ "${#missing[@]}" -eq 0 ] && return 0

    echo "Installing: ${missing[*]}"
    sudo=""
    [ "$(id -u)" -ne 0 ] && sudo="sudo"
    export DEBIAN_FRONTEND=noninteractive
    if declare -F before_install >/dev/null; then
        before_install
    fi
    # Another installer (a parallel CI stage, unattended upgrades) may hold the lock.
    $sudo apt-get -o DPkg::Lock::Timeout=600 update -qq
    $sudo apt-get -o DPkg::Lock::Timeout=600 install -y -qq --no-install-recommends "${missing[@]}"
}
