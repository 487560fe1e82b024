# Shared by the scripts of this folder: sourced, not run.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

say() { printf '\n== %s\n' "$*"; }

# Configures and builds one preset in build/PRESET.
build_preset() {
    local preset=$1
    shift
    say "building $preset"
    cmake --preset "$preset" >"build/$preset.configure.log" 2>&1 || { cat "build/$preset.configure.log"; return 1; }
    cmake --build --preset "$preset" "$@"
}
mkdir -p build
