# Shared by ./run and ./test: what the machine needs, and the build. Sourced, from the project's root.

BUILD_PACKAGES=(g++ cmake ninja-build pkg-config qt6-base-dev qt6-svg-dev libxcb1-dev libxcb-res0-dev libxcb-shm0-dev
    libxcb-sync-dev libxcb-xinput-dev libtiff-dev libexpat1-dev libglib2.0-dev libtomlplusplus-dev qt6-tools-dev qt6-l10n-tools)
# What a machine without a display needs to show one all the same.
DISPLAY_PACKAGES=(xvfb openbox xdotool x11-utils imagemagick dbus adwaita-icon-theme fonts-dejavu-core
    fonts-wqy-zenhei fonts-lohit-deva fonts-tlwg-loma)
RUN_PACKAGES=(qt6-qpa-plugins libqt6svg6 shared-mime-info)
TEST_PACKAGES=(libgtest-dev libgmock-dev python3 clang-format codespell desktop-file-utils at-spi2-core
    python3-pyatspi)
# Desktops of others, for the slow tests.
DESKTOP_PACKAGES=(x11-xserver-utils trayer tint2 lxqt-panel xfwm4 kwin-x11 picom sway xwayland wtype grim
    ibus)

say() { printf '%s\n' "$*"; }

# install_packages NAME…: those that are missing, with the system's package client.
install_packages() {
    local missing=() name
    for name in "$@"; do
        dpkg-query -W -f='${db:Status-Status}' "$name" 2>/dev/null | grep -qx installed || missing+=("$name")
    done
    [ ${#missing[@]} -eq 0 ] && return
    local root=()
    [ "$(id -u)" -eq 0 ] || root=(sudo)
    say "Installing ${#missing[@]} packages: ${missing[*]}"
    "${root[@]}" apt-get -qq update
    "${root[@]}" env DEBIAN_FRONTEND=noninteractive apt-get -qq install -y --no-install-recommends \
        "${missing[@]}" >/dev/null
}

# build PRESET [target…]
build() {
    local preset=$1
    shift
    say "Building ($preset) in build/$preset"
    if [ ! -f "build/$preset/build.ninja" ]; then
        cmake --preset "$preset" >"build-$preset.log" 2>&1 || { cat "build-$preset.log"; return 1; }
        rm -f "build-$preset.log"
    fi
    cmake --build --preset "$preset" "${@/#/--target=}" -- --quiet
}
