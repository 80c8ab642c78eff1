# Sourced by check, demo and bench/run. Every package that the project needs is named here, once.

declare -A PACKAGES=(
    [build]="g++ cmake ninja-build libboost-dev libhwy-dev libgdal-dev"
    [test]="libgtest-dev"
    [docs]="unzip"
    [bench]="libbenchmark-dev"
    [files]="time gdal-bin"
    [peers]="python3-numpy python3-scipy python3-opencv"
)

stage() # TEXT
{
    printf '\n== %s\n' "$1"
}

fail() # TEXT...
{
    printf '%s\n' "$@" >&2
    exit 1
}

# Prints those of the packages that are not installed.
missing_packages() # PACKAGE...
{
    local package
    for package in "$@"; do
        case $(dpkg-query -W -f '${db:Status-Status}' "$package" 2>/dev/null) in
            installed) ;;
            *) printf '%s ' "$package" ;;
        esac
    done
}

as_root() # COMMAND...
{
    if [ "$(id -u)" = 0 ]; then "$@"; else sudo "$@"; fi
}

apt() # ARGUMENT...
{
    as_root env DEBIAN_FRONTEND=noninteractive apt-get -q -o Acquire::Retries=3 "$@"
}

# Installs what is missing of the packages of some groups; asks apt for nothing when all is there.
install_packages() # GROUP...
{
    local group packages="" missing
    for group in "$@"; do
        packages+=" ${PACKAGES[$group]}"
    done
    if ! command -v dpkg-query >/dev/null; then
        echo "This system has no dpkg. Going on without; needed are what Debian calls:$packages"
        return
    fi
    # shellcheck disable=SC2086 # a list of words
    missing=$(missing_packages $packages)
    if [ -z "$missing" ]; then
        echo "All there:$packages"
        return
    fi
    echo "Missing: $missing"
    local command="apt-get update && apt-get install --no-install-recommends ${missing% }"
    if [ "$(id -u)" != 0 ] && ! command -v sudo >/dev/null; then
        fail "These packages are missing, and installing them takes root:" "    $command"
    fi
    mkdir -p build
    echo "Installing, with what they depend on; apt's own words go to build/packages.log"
    apt update >build/packages.log 2>&1 ||
        echo "apt-get update failed; going on with the package lists that are there."
    # shellcheck disable=SC2086
    if ! apt install -y --no-install-recommends $missing >>build/packages.log 2>&1; then
        tail -n 20 build/packages.log >&2
        fail "The packages could not be installed. By hand, as root:" "    $command"
    fi
}
