#!/usr/bin/env bash
# Builds libjpeg-turbo 3 (12-bit samples alongside 8-bit, lossless JPEG) from the Debian source package of
# the unstable suite, as a static, position-independent library, into a cache directory, once.
#
#   scripts/build-libjpeg-turbo.sh PREFIX
#
# The archive address is taken from this machine's own apt configuration: a project-local sources list
# pointing at the same Debian mirror is written into a scratch directory, so the system's apt state is untouched.
set -euo pipefail

prefix=${1:?usage: build-libjpeg-turbo.sh PREFIX}
if [ -f "$prefix/lib/libjpeg.a" ] && [ -f "$prefix/.complete" ]; then
    exit 0
fi

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# The first Debian archive (not the security archive) that apt is configured with, in either format.
mirror=$(
    {
        for f in /etc/apt/sources.list.d/*.sources; do
            if [ -f "$f" ]; then awk '/^URIs:/{for (i = 2; i <= NF; i++) print $i}' "$f"; fi
        done
        for f in /etc/apt/sources.list /etc/apt/sources.list.d/*.list; do
            if [ -f "$f" ]; then
                awk '$1 == "deb" || $1 == "deb-src" {for (i = 2; i <= NF; i++) if ($i ~ /^[a-z]+:\/\//) {print $i; break}}' "$f"
            fi
        done
    } | grep -E '/debian/?$' | grep -v security | head -n 1 || true
)
if [ -z "$mirror" ]; then
    echo "build-libjpeg-turbo: no Debian archive found in the apt configuration" >&2
    exit 1
fi

keyring=/usr/share/keyrings/debian-archive-keyring.gpg
mkdir -p "$work/apt/lists/partial" "$work/apt/cache/archives/partial" "$work/apt/parts" "$work/src"
echo "deb-src [signed-by=$keyring] $mirror unstable main" >"$work/apt/sources.list"
apt_opts=(
    -o "Dir::Etc::SourceList=$work/apt/sources.list"
    -o "Dir::Etc::SourceParts=$work/apt/parts"
    -o "Dir::State::Lists=$work/apt/lists"
    -o "Dir::Cache=$work/apt/cache"
    -o "APT::Sandbox::User=root"
)

echo "Fetching the libjpeg-turbo source package (Debian unstable)"
apt-get "${apt_opts[@]}" -qq update
(cd "$work/src" && apt-get "${apt_opts[@]}" -qq source libjpeg-turbo >/dev/null)

srcdir=$(find "$work/src" -mindepth 1 -maxdepth 1 -type d -name 'libjpeg-turbo-*' | head -n 1)
version=${srcdir##*/libjpeg-turbo-}
case "$version" in
3.*) ;;
*)
    echo "build-libjpeg-turbo: unstable carries libjpeg-turbo $version, 3.x is needed" >&2
    exit 1
    ;;
esac

echo "Building libjpeg-turbo $version into $prefix"
cmake -S "$srcdir" -B "$work/build" -DCMAKE_BUILD_TYPE=Release -DCMAKE_INSTALL_PREFIX="$prefix" \
    -DCMAKE_INSTALL_LIBDIR=lib -DENABLE_SHARED=OFF -DENABLE_STATIC=ON -DCMAKE_POSITION_INDEPENDENT_CODE=ON \
    -DWITH_TURBOJPEG=OFF -DWITH_JAVA=OFF -DREQUIRE_SIMD=ON >"$work/configure.log" 2>&1 ||
    { cat "$work/configure.log" >&2; exit 1; }
cmake --build "$work/build" -j"$(nproc)" --target jpeg-static >"$work/build.log" 2>&1 ||
    { tail -n 50 "$work/build.log" >&2; exit 1; }
rm -rf "$prefix"
mkdir -p "$prefix/lib" "$prefix/include"
cp "$work/build/libjpeg.a" "$prefix/lib/"
cp "$srcdir/src/jpeglib.h" "$srcdir/src/jerror.h" "$srcdir/src/jmorecfg.h" "$work/build/jconfig.h" "$prefix/include/" 2>/dev/null ||
    cp "$srcdir/jpeglib.h" "$srcdir/jerror.h" "$srcdir/jmorecfg.h" "$work/build/jconfig.h" "$prefix/include/"
echo "$version" >"$prefix/.complete"
