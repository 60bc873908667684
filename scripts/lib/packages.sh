# The Debian packages that this project needs, by purpose, and how to get those that are missing.

build_packages=(
    ca-certificates ccache cmake g++ gettext ninja-build pkg-config
    libp11-kit-dev libpam0g-dev libpcsclite-dev libpugixml-dev libseccomp-dev libsqlite3-dev libsqlitecpp-dev libssl-dev libsystemd-dev
    libqt6opengl6-dev libqt6svg6 qt6-base-dev qt6-tools-dev
)

# A software card, the standard tools that fill it, and a message bus.
demo_packages=(dbus opensc openssl p11-kit-modules softhsm2)

test_packages=(
    gcovr git gnutls-bin libgmock-dev libgtest-dev mandoc p11-kit pinentry-tty procps
    python3-cryptography qt6-gtk-platformtheme systemd
    black clang clang-format clang-tidy libclang-rt-14-dev pyflakes3 shellcheck
)

# A screen in memory, and what looks at it.
bench_packages=(dbus libxcb1-dev xvfb)

# What boots a container with a desktop in it.
lab_packages=(mmdebstrap systemd-container)

# install_packages NAME... : installs those that are missing, and asks nothing.
install_packages() {
    local missing=() package become=()
    for package in "$@"; do
        [[ $(dpkg-query -W -f '${db:Status-Status}' "$package" 2>/dev/null) == installed ]] ||
            missing+=("$package")
    done
    ((${#missing[@]})) || return 0

    if ((EUID != 0)); then
        command -v sudo >/dev/null || {
            echo "These packages are missing, and there is no sudo to install them: ${missing[*]}" >&2
            return 1
        }
        become=(sudo)
    fi
    echo "Installing ${missing[*]}"
    local log
    log=$(mktemp)
    if ! { "${become[@]}" apt-get -q -o DPkg::Lock::Timeout=600 update &&
        "${become[@]}" env DEBIAN_FRONTEND=noninteractive apt-get -q -y \
            -o DPkg::Lock::Timeout=600 install --no-install-recommends "${missing[@]}"; } \
        </dev/null >"$log" 2>&1; then
        tail -n 20 "$log" >&2
        echo "The packages could not be installed; apt's last words are above." >&2
        rm -f "$log"
        return 1
    fi
    rm -f "$log"
}
