#!/bin/sh
# packages_test.sh BUILD_FOLDER VERSION: makes the packages, looks into them, installs the Debian ones into a scratch root
# beside stand-ins of a server's programs, uses what is there as an installed user would, and removes them again.
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
for kind in DEB RPM; do
    [ $kind = DEB ] || command -v rpmbuild >/dev/null || continue
    cpack -G $kind --config "$build/CPackConfig.cmake" -B "$scratch/packages" >cpack.log 2>&1 || {
        cat cpack.log >&2
        fail "cpack -G $kind"
    }
done
provider=$(echo packages/norvane-fc-provider_"$version"_*.deb)
tools=$(echo packages/norvane-fc-provider-tools_"$version"_*.deb)
[ -f "$provider" ] && [ -f "$tools" ] || fail "no packages: $(ls packages)"

lintian --allow-root --fail-on error "$provider" "$tools" || fail "lintian"

# The servers' programs note how they were called.
mkdir bin
for program in sfcbstage sfcbunstage sfcbrepos; do
    cat >bin/$program <<END
#!/bin/sh
echo "$program \$*" >>"$scratch/calls"
[ ! -e "$scratch/refuse" ]
END
    chmod +x bin/$program
done

# as_installed COMMAND...: where /var and /run are those of the scratch root, and its programs are found first.
as_installed() {
    flags=-m
    [ "$(id -u)" -eq 0 ] || flags=-rm
    unshare $flags sh -c 'cd "$0/root" && mount --bind var/lib /var/lib && mount --bind var/log /var/log &&
        mount --bind run /run && cd "$0" && PATH="$0/bin:$0/root/usr/sbin:$0/root/usr/bin:$PATH" exec "$@"' "$scratch" "$@"
}
# package_manager ARGUMENTS...: the scratch root has no shell for the packages' scripts, and nothing that they depend on.
package_manager() {
    as_installed dpkg --root="$scratch/root" --force-not-root --force-depends --force-script-chrootless "$@" >dpkg.log 2>&1 || {
        cat dpkg.log >&2
        fail "dpkg $*"
    }
}
installed_files() {
    (cd root && find . -path ./var/lib/dpkg -prune -o -type f -print | sort)
}

mkdir -p root/var/lib/dpkg/info root/var/lib/dpkg/updates root/var/log root/run
touch root/var/lib/dpkg/status
package_manager -i "$provider" "$tools"

for file in usr/sbin/norvane-provider-register usr/share/norvane-fc-provider/mof/20_module.mof \
    usr/share/norvane-fc-provider/sfcb/norvane_fc_provider.reg usr/share/man/man8/norvane-provider-register.8.gz \
    usr/share/doc/norvane-fc-provider/docs/install.md usr/share/doc/norvane-fc-provider/copyright usr/bin/nvrcim usr/bin/nvrsimctl \
    usr/share/man/man5/norvane_fc_provider.conf.5.gz usr/share/bash-completion/completions/nvrcim; do
    [ -e "root/$file" ] || fail "$file is not installed"
done

# The installation has registered the module; the command says so, and has nothing to do a second time.
staged="sfcbstage -n root/norvane -r $scratch/root/usr/share/norvane-fc-provider/sfcb/norvane_fc_provider.reg"
grep -q "^$staged " calls || fail "the installation called: $(cat calls)"
[ "$(as_installed norvane-provider-register status --server sfcb)" = "sfcb: registered in root/norvane" ] || fail "status"
as_installed norvane-provider-register register | grep -q "registered already" || fail "a second registration"
classes=$(as_installed norvane-provider-register list | wc -l)
[ "$classes" -eq 141 ] || fail "$classes classes are listed"

# Nothing of the build tree may be needed: the programs find their own files.
ports=$(sh "$here/../../scripts/private_etc.sh" root/usr/bin/nvrcim --scenario root/usr/share/norvane-fc-provider/scenarios/typical.toml enum NVRHBA_FCPort)
[ "$(echo "$ports" | wc -l)" -eq 5 ] || fail "the installed nvrcim says: $ports"

# A server that refuses fails neither the removal nor another installation.
touch refuse
package_manager -r norvane-fc-provider-tools norvane-fc-provider
grep -q "still registered" root/var/log/norvane-provider-register.log || fail "the log tells no failure"
package_manager -i "$provider"
rm refuse calls
package_manager -P norvane-fc-provider norvane-fc-provider-tools
grep -q "^sfcbunstage -n root/norvane " calls || fail "the removal called: $(cat calls)"
left=$(installed_files | grep -v -e '^./run/' -e '^./var/log/dpkg.log$' || true)
[ -z "$left" ] || fail "the removal leaves $left"

# As the page on installation has it without packages.
DESTDIR="$scratch/tree" cmake --install "$build" --component provider --prefix /usr >install.log || fail "cmake --install"
[ "$(tree/usr/sbin/norvane-provider-register list | wc -l)" -eq 141 ] || fail "the installed tree lists no classes"

command -v rpmbuild >/dev/null || exit 0
rpm=$(echo packages/norvane-fc-provider-"$version"-*.rpm)
rpm_tools=$(echo packages/norvane-fc-provider-tools-"$version"-*.rpm)
for pair in "$provider $rpm" "$tools $rpm_tools"; do
    dpkg-deb --fsys-tarfile "${pair% *}" | tar t | grep -v '/$' | sed 's,^\./,/,' | sort >deb.files
    rpm -qp --qf '[%{FILEMODES:perms} %{FILENAMES}\n]' "${pair#* }" | sed -n 's/^-[^ ]* //p' | sort >rpm.files
    diff deb.files rpm.files >&2 || fail "the packages of ${pair#* } differ"
done
rpm -qpl "$rpm" "$rpm_tools" >rpm.all
for folder in /usr/sbin /usr/bin /usr/lib /usr/share /usr/share/man /usr/share/man/man1 /usr/lib/.build-id; do
    ! grep -qx "$folder" rpm.all || fail "the package takes $folder for its own"
done
rpm -qp --scripts "$rpm" | grep -q 'register register || :' || fail "the script behind the installation"
rpm -qp --scripts "$rpm" | grep -q 'register unregister || :' || fail "the script before the removal"
rpm -qpR "$rpm_tools" >needs
grep -qx "norvane-fc-provider = $version" needs || fail "the tools need no module"
! grep -q nvrsim needs || fail "the tools need: $(cat needs)"
! rpm -qp --provides "$rpm_tools" | grep -q HBAAPI || fail "the tools pass for the system's library"
