#!/bin/sh
# packages_test.sh BUILD_FOLDER VERSION: makes the Debian packages, looks into them with lintian, unpacks them into a
# scratch root, and uses what is there as an installed user would.
set -eu
build="$1" version="$2"
here=$(cd "$(dirname "$0")" && pwd)
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT

fail() {
    echo "FAILED: $*" >&2
    exit 1
}

cd "$scratch"
cpack -G DEB --config "$build/CPackConfig.cmake" -B "$scratch/packages" >cpack.log 2>&1 || {
    cat cpack.log >&2
    fail "cpack"
}
provider=$(echo packages/norvane-fc-provider_"$version"_*.deb)
tools=$(echo packages/norvane-fc-provider-tools_"$version"_*.deb)
[ -f "$provider" ] && [ -f "$tools" ] || fail "no packages: $(ls packages)"

lintian --allow-root --fail-on error "$provider" "$tools" || fail "lintian"

for package in "$provider" "$tools"; do
    dpkg-deb -x "$package" root
done
for file in usr/sbin/norvane-provider-register usr/share/norvane-fc-provider/mof/20_module.mof \
    usr/share/norvane-fc-provider/sfcb/norvane_fc_provider.reg usr/share/man/man8/norvane-provider-register.8.gz \
    usr/share/doc/norvane-fc-provider/docs/install.md usr/share/doc/norvane-fc-provider/copyright usr/bin/nvrcim usr/bin/nvrsimctl \
    usr/share/man/man5/norvane_fc_provider.conf.5.gz usr/share/bash-completion/completions/nvrcim; do
    [ -e "root/$file" ] || fail "$file is not installed"
done
dpkg-deb -I "$provider" postinst | grep -q 'register register || true' || fail "postinst"
dpkg-deb -I "$provider" prerm | grep -q 'register unregister || true' || fail "prerm"

# Nothing of the build tree may be needed: the programs find their own files.
ports=$(sh "$here/../../scripts/private_etc.sh" root/usr/bin/nvrcim --scenario root/usr/share/norvane-fc-provider/scenarios/typical.toml enum NVRHBA_FCPort)
[ "$(echo "$ports" | wc -l)" -eq 5 ] || fail "the installed nvrcim says: $ports"
classes=$(root/usr/sbin/norvane-provider-register list | wc -l)
[ "$classes" -eq 141 ] || fail "$classes classes are listed"
