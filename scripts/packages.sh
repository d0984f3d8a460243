# Sourced by the scripts in this folder: installs the Debian packages that they need, and builds.

# need PACKAGE…: installs missing packages. Without root, prints the command to run and exits with 1.
need() {
  local missing=() package
  for package in "$@"; do
    dpkg-query -W -f '${Status}' "$package" 2>/dev/null | grep -q 'ok installed' || missing+=("$package")
  done
  [ ${#missing[@]} -eq 0 ] && return
  if [ "$(id -u)" -ne 0 ]; then
    printf 'Some Debian packages are missing. As root, run\n\n  apt-get install --no-install-recommends %s\n\nand start this script again.\n' \
      "${missing[*]}" >&2
    exit 1
  fi
  echo "== Installing ${missing[*]}"
  export DEBIAN_FRONTEND=noninteractive
  mkdir -p build
  if ! { apt-get update -qq && apt-get install -qq -y --no-install-recommends --no-remove "${missing[@]}"; } \
       >build/apt.log 2>&1; then
    cat build/apt.log >&2
    echo "apt-get could not install the packages." >&2
    exit 1
  fi
}

to_build=(g++ cmake ninja-build libcli11-dev nlohmann-json3-dev)
to_test=(libgtest-dev libgmock-dev librapidcheck-dev libfuse3-dev pkgconf python3 strace)
# For tests on file systems that these tools make, and tests of manual pages and completions.
to_test+=(e2fsprogs xfsprogs btrfs-progs squashfs-tools dosfstools bindfs fuse-overlayfs)
to_test+=(mandoc zsh fish jq inotify-tools)
# For a Turkish locale, in which i and I are different letters.
to_test+=(locales)
# For the type hints of the Python client.
to_test+=(mypy)
# For tests of real HFS and HFS+ volumes in a virtual machine, and tests of the Debian packages.
to_emulate=(hfsutils user-mode-linux qemu-system-x86 busybox-static cpio)
to_package=(dpkg-dev file python3)
# For checking the packages.
to_check_packages=(lintian)
# Programs that the benchmarks compare with, and the library for benchmarks within a process.
to_measure=(libbenchmark-dev openssh-sftp-server bfs e2fsprogs btrfs-progs xfsprogs bindfs)
to_format=(clang-format)
to_lint=(clang-tidy)
to_fuzz=(clang libclang-rt-dev)
to_cover=(clang libclang-rt-dev llvm)
# For building for other machines and running the result.
to_make_i386=(g++-i686-linux-gnu libc6-i386 lib32stdc++6)
to_make_arm64=(g++-aarch64-linux-gnu qemu-user-static)

# unpack_kernel FOLDER: unpacks Debian's kernel there without installing it, unless User Mode Linux is
# installed. Without either kernel, the tests that boot one are skipped.
unpack_kernel() {
  [ -d "$1" ] && return
  ls /usr/lib/uml/modules/*/kernel/fs/hfs >/dev/null 2>&1 && return
  local package
  package=$(apt-cache show linux-image-amd64 2>/dev/null |
    sed -n 's/^Depends: \(linux-image-[^ ,]*\).*/\1/p' | head -1)
  echo "== Unpacking ${package:-no kernel, as apt has none for this machine}"
  [ -n "$package" ] || return 0
  mkdir -p "$1"
  if ! (cd "$1" && apt-get download -qq "$package" && dpkg-deb --fsys-tarfile ./*.deb |
        tar -x --wildcards './boot/vmlinuz*' '*/fs/hfs' '*/fs/hfsplus' '*/fs/nls' '*/drivers/block' '*/drivers/cdrom') \
       >build/kernel.log 2>&1; then
    cat build/kernel.log >&2
    rm -rf "$1"
  fi
  rm -f "$1"/*.deb
}

# build PRESET [TARGET…]: configures if necessary, then builds.
build() {
  local preset=$1
  shift
  echo "== Building ($preset)"
  configure "$preset"
  cmake --build --preset "$preset" ${1:+--target "$@"} -- --quiet
}

configure() {
  [ -f "build/$1/build.ninja" ] || cmake --preset "$1" >/dev/null
}

# run_tests PRESET [ctest's options]: two tests for each processor, as many of them wait.
run_tests() {
  ctest --preset "$1" -j "$(($(nproc) * 2))" "${@:2}"
}

# lint CHECKS: runs these checks of .clang-tidy on all sources but tests and fuzz targets. Starts with
# the longest source, so that all processors finish at about the same time.
lint() {
  configure dev
  find . -path ./build -prune -o -path ./tests -prune -o -path ./fuzz -prune -o -name '*.cpp' -printf '%s %p\n' |
    sort -rn | cut -d ' ' -f 2 | xargs -P "$(nproc)" -n 1 clang-tidy --quiet --checks="$1" -p build/dev 2>/dev/null
}
