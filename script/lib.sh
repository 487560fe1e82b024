# Shared by the scripts of this folder: sourced, not run.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

say() { printf '\n== %s\n' "$*"; }

# What stands before a command that needs to be root.
as_root=()
[ "$(id -u)" -eq 0 ] || as_root=(sudo)

# An index that is out of step is told by the command that needs it, so that this never fails.
update_indexes() { "${as_root[@]}" apt-get update -qq || say "apt-get update complained; going on"; }

# Configures and builds one preset in build/PRESET.
build_preset() {
    local preset=$1
    shift
    [ "$preset" != armhf ] || script/sysroot
    say "building $preset"
    cmake --preset "$preset" >"build/$preset.configure.log" 2>&1 || { cat "build/$preset.configure.log"; return 1; }
    cmake --build --preset "$preset" "$@"
}
mkdir -p build

# What was compiled before, in whatever checkout, is not compiled again.
if command -v ccache >/dev/null; then
    export CMAKE_CXX_COMPILER_LAUNCHER=ccache CCACHE_BASEDIR=$PWD CCACHE_NOHASHDIR=1 CCACHE_MAXSIZE=8G
    export CCACHE_SLOPPINESS=time_macros,include_file_mtime,include_file_ctime
fi
