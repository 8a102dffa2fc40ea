# shellcheck shell=bash
# shellcheck disable=SC2034 # read by the scripts that source this
# Debian packages that building and checking the repository needs.

build_packages=(
    cmake
    g++
    libcli11-dev
    libgmock-dev
    libgtest-dev
    libnl-3-dev
    libnl-route-3-dev
    libsystemd-dev
    ninja-build
    nlohmann-json3-dev
    pkg-config
)

test_packages=(
    abigail-tools
    binutils
    clang
    dhcpcd-base
    dnsmasq-base
    ethtool
    iproute2
    systemd
)

lint_packages=(
    clang-format
    clang-tidy
    cppcheck
    shellcheck
)

package_packages=(
    debhelper
    dpkg-dev
    fakeroot
    scdoc
)

package_test_packages=(
    bsdextrautils
    lintian
    man-db
    qemu-system-x86
    zsh
)

coverage_packages=(
    gcovr
)

fuzz_packages=(
    clang
    libclang-rt-dev
)
