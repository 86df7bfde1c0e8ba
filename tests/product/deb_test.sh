#!/bin/sh
# deb_test.sh build_folder: makes the Debian packages from what is built, unpacks them into a folder that stands for the
# system's root, and follows an installation, an upgrade and a removal there: names, SONAMEs and dependencies, the
# alternatives, and a program built from their files. The machine itself is not changed.
set -eu

build=$1
for program in dpkg-deb dpkg-shlibdeps update-alternatives cpack; do
  command -v $program >/dev/null || { echo "no $program here" && exit 77; }
done
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
root=$folder/root
arch=x86_64-linux-gnu
libraries=$root/usr/lib/$arch

fail() { echo "$*" && exit 1; }

# expect what got wanted
expect() {
  [ "$2" = "$3" ] || fail "$1: \"$2\" instead of \"$3\""
}

(cd "$build" && cpack -B "$folder" -G DEB) > "$folder/cpack.log" 2>&1 || { cat "$folder/cpack.log" && exit 1; }
library=$(ls "$folder"/libqtb10_*.deb)
development=$(ls "$folder"/libqtb-dev_*.deb)
for package in "$folder"/*.deb; do
  dpkg-deb -x "$package" "$root"
done

# What the packages say of themselves.
field() { dpkg-deb -f "$1" "$2"; }
expect "Provides" "$(field "$library" Provides)" "libblas.so.3, libblas64.so.3"
field "$library" Depends | grep -q 'libc6 (>= .*libgomp1 (>= ' || fail "Depends: $(field "$library" Depends)"
expect "Depends of libqtb-dev" "$(field "$development" Depends)" "libqtb10 (= $(field "$library" Version))"
dpkg-deb -e "$library" "$folder/control"
expect "shlibs" "$(cut -d' ' -f1-3 "$folder/control/shlibs")" "libqtb 10 libqtb10"
grep -qx 'activate-noawait ldconfig' "$folder/control/triggers" || fail "no trigger for ldconfig"
if dpkg-deb -c "$library" | grep -vE ' root/root ' || dpkg-deb -c "$library" | grep -E '^-..(.w|....w)'; then
  fail "those files have other owners than root, or others may write them"
fi
if dpkg-deb -c "$library" | grep -E '/(include|pkgconfig|cmake)/|\.so -> '; then
  fail "files of development in the package of the library"
fi

# What is in them: SONAMEs, no path to search for libraries, no debugging sections.
for pair in libqtb.so.10=libqtb.so.10 qtb/libblas.so.3=libblas.so.3 qtb/libblas64.so.3=libblas64.so.3 \
  qtb/libqtb64.so=libqtb64.so; do
  file=$libraries/${pair%=*}
  dynamic=$(${OBJDUMP:-objdump} -p "$file")
  expect "SONAME of $file" "$(echo "$dynamic" | sed -n 's/^ *SONAME *//p')" "${pair#*=}"
  ! echo "$dynamic" | grep -E 'RPATH|RUNPATH' || fail "$file has a path of its own"
  ! ${OBJDUMP:-objdump} -h "$file" | grep -E '\.(debug_info|symtab)' || fail "$file is not stripped"
done
for link in libqtb.so qtb/libblas.so qtb/libblas64.so; do
  [ -e "$libraries/$link" ] || fail "$link of libqtb-dev leads nowhere"
done

# The alternatives of the root: ours beside the reference BLAS (10) and a faster one (100). The package's own scripts
# run, with an update-alternatives that keeps to the root.
mkdir -p "$folder/bin" "$root/etc/alternatives" "$root/var/lib/dpkg/alternatives" "$root/var/log"
cat > "$folder/bin/update-alternatives" << END
#!/bin/sh
exec $(command -v update-alternatives) --root "$root" --quiet "\$@"
END
chmod +x "$folder/bin/update-alternatives"
PATH=$folder/bin:$PATH
export PATH
other() {  # name folder priority
  mkdir -p "$libraries/$2" && : > "$libraries/$2/$1"
  update-alternatives --install /usr/lib/$arch/"$1" "$1-$arch" "/usr/lib/$arch/$2/$1" "$3"
}
# chosen name folder: the folder whose library the name leads to.
chosen() {
  expect "$libraries/$1" "$(readlink "$libraries/$1")" "/etc/alternatives/$1-$arch"
  expect "$1 of alternatives" "$(readlink "$root/etc/alternatives/$1-$arch")" "/usr/lib/$arch/$2/$1"
}
other libblas.so.3 blas 10
other libblas64.so.3 blas64 10
"$folder/control/postinst" configure
"$folder/control/postinst" configure 10.2.1
chosen libblas.so.3 qtb
chosen libblas64.so.3 qtb
update-alternatives --query "libblas.so.3-$arch" | grep -A1 "qtb/libblas" | grep -qx 'Priority: 50' ||
  fail "no priority 50"
other libblas.so.3 faster 100
chosen libblas.so.3 faster
update-alternatives --set "libblas.so.3-$arch" "/usr/lib/$arch/qtb/libblas.so.3"
chosen libblas.so.3 qtb
"$folder/control/prerm" upgrade 10.2.3
chosen libblas.so.3 qtb
"$folder/control/prerm" remove
chosen libblas.so.3 faster
chosen libblas64.so.3 blas64
if update-alternatives --query "libblas.so.3-$arch" | grep qtb || grep -r qtb "$root/var/lib/dpkg/alternatives"; then
  fail "the removal has left those"
fi

# A program built from the packages' files alone.
cat > "$folder/program.c" << END
#include <qtb/cblas.h>
int main(void) {
  const double x[] = {1, 2}, y[] = {3, 4};
  return cblas_ddot(2, x, 1, y, 1) != 11;
}
END
PKG_CONFIG_PATH=$libraries/pkgconfig
export PKG_CONFIG_PATH
# shellcheck disable=SC2046 # flags are words
"${CC:-cc}" "$folder/program.c" $(pkg-config --cflags --libs qtb-cblas) -o "$folder/program"
LD_LIBRARY_PATH=$libraries/qtb "$folder/program"
echo "packages: registered, kept in an upgrade, and removed"
