# Functions shared by the project's commands. Sourced, not run; expects `set -euo pipefail`.

project_dir=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
# ccache compares names of files relative to the project, so that clones in different directories share
# its results. The debug information is relative, too (VYRA_RELATIVE_DEBUG_PATHS).
export CCACHE_BASEDIR=$project_dir

fail() {
    printf '%s: %s\n' "${0##*/}" "$1" >&2
    exit "${2:-1}"
}

# Returns 0 if a package is installed, or another one that provides it, as in a later release.
installed() {
    [[ $(dpkg-query -W -f='${db:Status-Status}' "$1" 2>/dev/null) == installed ]] ||
        dpkg-query -W -f='${db:Status-Status} ${Provides}\n' | grep -qE "^installed (.*, )?${1//+/\\+}( \(|,|\$)"
}

# Installs the missing packages of scripts/packages.txt and of the arguments. Needs root only if some are missing.
install_packages() {
    local wanted missing=() package
    mapfile -t wanted < <(grep -vE '^[[:space:]]*(#|$)' "$project_dir/scripts/packages.txt")
    wanted+=("$@")
    command -v dpkg-query >/dev/null ||
        fail "this machine has no Debian packages; install the counterparts of scripts/packages.txt by hand"
    for package in "${wanted[@]}"; do
        installed "$package" || missing+=("$package")
    done
    ((${#missing[@]})) || return 0

    local as_root=()
    if ((EUID != 0)); then
        command -v sudo >/dev/null || fail "run as root: apt-get install ${missing[*]}"
        as_root=(sudo)
    fi
    printf 'Installing %d missing packages: %s\n' "${#missing[@]}" "${missing[*]}"
    run_quietly "$(mktemp -t vyra-packages.XXXXXX.log)" "${as_root[@]}" apt-get update
    run_quietly "$(mktemp -t vyra-packages.XXXXXX.log)" "${as_root[@]}" env DEBIAN_FRONTEND=noninteractive \
        apt-get install --yes --no-install-recommends "${missing[@]}"
}

# Runs a command with its output in a log, which is shown only if the command fails.
run_quietly() {
    local log=$1
    shift
    if ! "$@" >"$log" 2>&1; then
        cat "$log" >&2
        fail "failed: $* (the output above is in $log)"
    fi
}

# Configures, with the further arguments given, and builds a preset; its files are in build/PRESET.
build_preset() {
    local preset=$1 build_dir=$project_dir/build/$1
    shift
    mkdir -p "$build_dir"
    printf 'Building (%s) ...\n' "$preset"
    # CMake searches presets in the current folder; the caller's relative paths refer to the caller's folder.
    (
        cd "$project_dir"
        run_quietly "$build_dir/configure.log" cmake --preset "$preset" "$@"
        run_quietly "$build_dir/build.log" cmake --build --preset "$preset"
    )
}

# Checks arguments for ctest, which ignores unknown ones and would run every test. Stores them in
# `ctest_arguments`, with absolute paths: ctest runs in the project's folder.
read_ctest_arguments() {
    local known argument option='' values paths='^(-O|--output-log|--output-junit|--resource-spec-file)$'
    command -v ctest >/dev/null || install_packages
    known=$(ctest --help)
    values=$(grep -oE -- '(^|[ ,])-[A-Za-z-]+ <' <<<"$known" | tr -d ' ,<')
    ctest_arguments=()
    for argument in "$@"; do
        if [[ $option =~ $paths ]]; then
            argument=$(realpath -m -- "$argument") option=''
        elif [[ -n $option ]] && grep -qxFe "$option" <<<"$values"; then
            option=''
        elif [[ $argument =~ ^-j[0-9]+$ || $argument == -* ]] &&
            grep -qE -- "(^|[ ,])(${argument%%=*}|${argument/%[0-9]*/})([][ ,=]|$)" <<<"$known"; then
            option=$argument
        else
            fail "unknown argument $argument; --help lists all, ctest --help those that are passed on" 2
        fi
        if [[ $argument == *=* && ${argument%%=*} =~ $paths ]]; then
            argument=${argument%%=*}=$(realpath -m -- "${argument#*=}")
        fi
        ctest_arguments+=("$argument")
    done
    if [[ -n $option ]] && grep -qxFe "$option" <<<"$values"; then fail "$option needs a value" 2; fi
}

# Runs the tests of a preset with `ctest_arguments`, in the environment that the arguments set up.
# Tests that pass are not listed.
run_tests() {
    local preset=$1 status=0
    shift
    echo "Testing ..."
    (
        cd "$project_dir"
        # All tests share one virtual display if there is no real one.
        "$project_dir/tests/support/with-display" "$@" \
            ctest --preset "$preset" --parallel "$(nproc)" "${ctest_arguments[@]}" |
            { grep -vE '^ *Start +[0-9]+:|^ *[0-9]+/[0-9]+ Test .*   Passed +[0-9.]+ sec' || true; }
    ) || status=$?
    return $status
}

# Returns 0 if there are a display, a GPU that draws, and an OpenCL runtime other than the CPU's.
has_display_and_gpu() {
    [[ -n ${DISPLAY:-}${WAYLAND_DISPLAY:-} ]] && compgen -G '/dev/dri/renderD*' >/dev/null &&
        compgen -G '/etc/OpenCL/vendors/*.icd' | grep -qv pocl
}

# Runs the viewer, with glshare on a virtual display if the machine has no display or GPU.
viewer() {
    local program=$project_dir/build/release/bin/vyra-viewer
    if has_display_and_gpu; then
        "$program" "$@"
    else
        OPENCL_LAYERS=$project_dir/build/release/lib/libglshare.so \
            "$project_dir/tests/support/with-display" "$program" "$@"
    fi
}
