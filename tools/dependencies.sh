#!/usr/bin/env bash
# Fetches the libraries that the program is built from as Debian source packages, checks each archive against
# tools/dependencies.sha256 and builds them static: for mingw-w64, or for this machine under Clang's sanitizers.
# usage: tools/dependencies.sh FOLDER [native]
# result: FOLDER/install, or FOLDER/install-native, a CMAKE_PREFIX_PATH. A finished step is not repeated.
set -euo pipefail

tools=$(cd "$(dirname "$0")" && pwd)
source_root=$(dirname "$tools")
mkdir -p "$1"
cd "$1"

suffix=${2:+-$2}
case $suffix in
  '') toolchain=$source_root/cmake/windows-cross.cmake ;;
  -native) toolchain=$source_root/cmake/native-sanitized.cmake ;;
  *) echo "tools/dependencies.sh: the libraries are not built for '$2'" >&2 && exit 1 ;;
esac

sums=$tools/dependencies.sha256
stamp=install$suffix/built-from
inputs() { cat "$sums" "$tools/dependencies.sh" "$source_root"/cmake/dependencies/*/CMakeLists.txt "$toolchain" | sha256sum; }
[ -f "$stamp" ] && [ "$(cat "$stamp")" = "$(inputs)" ] && exit 0

say() { printf '    %s\n' "$*"; }

# --- fetch: apt with lists of its own, so that the machine's own lists stay as they are
fetch() {
  local mirror options package
  mirror=$(apt-get indextargets --format '$(REPO_URI)' 'Created-By: Packages' | grep -m1 '/debian/\?$')
  mkdir -p apt/lists/partial
  printf 'deb-src %s trixie main\n' "$mirror" > apt/sources.list
  options=(-o "Dir::Etc::SourceList=$PWD/apt/sources.list" -o Dir::Etc::SourceParts=/dev/null
           -o "Dir::State::Lists=$PWD/apt/lists" -o APT::Sandbox::User=root)
  say "reading the list of source packages"
  apt-get "${options[@]}" update -qq
  for package in libjsoncpp libyaml tinyxml2 libdeflate pytorch; do
    say "fetching $package"
    apt-get "${options[@]}" source --download-only --only-source --tar-only -qq "$package" > /dev/null
  done
}

verified() { sha256sum --check --quiet "$sums"; }

if ! verified > /dev/null 2>&1; then
  cut -c67- "$sums" | while read -r archive; do rm -f "$archive"; done
  fetch
  if ! verified; then
    echo "tools/dependencies.sh: an archive is missing or is not the one pinned in tools/dependencies.sha256 (above)." >&2
    echo "Nothing was built from it. If the change is meant, check the new archive and pin its SHA-256." >&2
    exit 1
  fi
fi

# --- build
unpack() { # ARCHIVE [PATTERN]: into source/<library>, without the archive's own top folder
  local target=source/$1 archive
  archive=$(cut -c67- "$sums" | grep -F "$2")
  rm -rf "$target"
  mkdir -p "$target"
  shift 2
  tar -xf "$archive" -C "$target" --strip-components=1 "$@"
}

build() { # NAME SOURCE [cmake options]
  local name=$1 source=$2
  shift 2
  say "building $name"
  {
    cmake -G Ninja -S "$source" -B "build$suffix/$name" -DCMAKE_BUILD_TYPE=Release -DBUILD_SHARED_LIBS=OFF \
      -DCMAKE_TOOLCHAIN_FILE="$toolchain" -DCMAKE_INSTALL_PREFIX="$PWD/install$suffix" "$@"
    cmake --build "build$suffix/$name" --target install
  } > "build$suffix-$name.log" 2>&1 || { tail -n 30 "build$suffix-$name.log" >&2; exit 1; }
}

rm -rf "build$suffix" "install$suffix"
unpack jsoncpp libjsoncpp
unpack yaml libyaml
unpack tinyxml2 tinyxml2
unpack libdeflate libdeflate
unpack miniz pytorch --strip-components=3 --wildcards '*/third_party/miniz-3.0.2/*'

build jsoncpp source/jsoncpp -DJSONCPP_WITH_TESTS=OFF -DJSONCPP_WITH_POST_BUILD_UNITTEST=OFF \
  -DJSONCPP_WITH_PKGCONFIG_SUPPORT=OFF -DBUILD_OBJECT_LIBS=OFF -DBUILD_STATIC_LIBS=ON
build yaml source/yaml -DBUILD_TESTING=OFF
build tinyxml2 source/tinyxml2 -Dtinyxml2_BUILD_TESTING=OFF
build libdeflate source/libdeflate -DLIBDEFLATE_BUILD_SHARED_LIB=OFF -DLIBDEFLATE_BUILD_GZIP=OFF
build miniz "$source_root/cmake/dependencies/miniz" -DMINIZ_SOURCE="$PWD/source/miniz"
build googletest /usr/src/googletest

inputs > "$stamp"
