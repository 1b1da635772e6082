# Sourced by ./demo and ./check, not run.

# What it takes to build and run; what the checks take beyond that.
buildPackages=(
    cmake g++ libcli11-dev libfmt-dev libre2-dev libxxhash-dev ninja-build
    nlohmann-json3-dev pkg-config scdoc zlib1g-dev
)
checkPackages=(
    clang clang-format clang-tidy dpkg-dev file fish gcovr libclang-rt-dev
    libgtest-dev liblzma-dev libmarisa-dev librapidcheck-dev libzstd-dev
    lintian llvm mypy pybind11-dev python3-build python3-dev
    python3-distributed python3-fsspec python3-h5py python3-numpy
    python3-pandas python3-pytest python3-setuptools python3-torch
    python3-wheel python3-xxhash tmux valgrind zsh
)

# Installs those of the given Debian packages that are missing. Silent when
# none is; returns 1 after one line on standard error when one cannot be had.
#
# log  a file that receives what apt says.
installPackages() {
    local log=$1 missing=() package asRoot=()
    shift
    for package in "$@"; do
        dpkg-query -W -f='${db:Status-Status}' "$package" 2>/dev/null |
            grep -qx installed || missing+=("$package")
    done
    ((${#missing[@]})) || return 0
    if ((EUID != 0)); then
        if ! command -v sudo >/dev/null; then
            echo "These packages are missing, and only root can install" \
                "them: ${missing[*]}" >&2
            return 1
        fi
        asRoot=(sudo)
    fi
    echo "Installing ${missing[*]}"
    export DEBIAN_FRONTEND=noninteractive
    if ! { "${asRoot[@]}" apt-get update &&
        "${asRoot[@]}" apt-get install -y --no-install-recommends \
            "${missing[@]}"; } >"$log" 2>&1 </dev/null; then
        tail -n 20 "$log" >&2
        echo "Cannot install ${missing[*]}; all that apt said is in $log" >&2
        return 1
    fi
}
