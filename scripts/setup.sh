#!/usr/bin/env bash
# Installs the Debian 12 packages that building, testing and validating NavMiscLib need.
# Only what is missing is installed. Needs root (or sudo).
set -euo pipefail

packages=(
  build-essential cmake ninja-build pkg-config git
  clang libclang-rt-14-dev             # fuzz targets (libFuzzer)
  zlib1g-dev libzip-dev                # KMZ archives
  libsodium-dev                        # protection of the stored password
  libexiv2-dev                         # the tagging tool
  libgtest-dev libgmock-dev libbenchmark-dev
  libcli11-dev                         # the command line's options
  libxml2-dev                          # reading GPX and TCX files
  libexpat1-dev                        # reading the web service's XML replies
  libcurl4-openssl-dev                 # the web service
  nlohmann-json3-dev                   # the geolocation answers of the web service
  libcpp-httplib-dev                   # the tests' loopback web server
  libgps-dev gpsd gpsd-clients         # live positions from gpsd; gpsfake for its tests
  libxml2-utils gpsbabel gdal-bin zip unzip   # readers that check the exported documents
  exiv2 libimage-exiftool-perl         # readers that check the tagged photos
  python3-gpxpy                        # moving times to compare with
  tzdata
  locales                              # a comma-decimal locale for the locale tests
)

missing=()
for p in "${packages[@]}"; do
  if ! dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed"; then
    missing+=("$p")
  fi
done

SUDO=""
if [ "$(id -u)" -ne 0 ]; then SUDO="sudo"; fi

# Tests prove that numbers in files ignore the process locale; they need a comma-decimal locale.
ensure_locale() {
  if ! locale -a 2>/dev/null | grep -qix 'de_DE\.utf-\?8'; then
    echo "setup: generating de_DE.UTF-8"
    $SUDO sed -i 's/^# *de_DE.UTF-8 UTF-8/de_DE.UTF-8 UTF-8/' /etc/locale.gen
    $SUDO locale-gen
  fi
}

if [ ${#missing[@]} -eq 0 ]; then
  echo "setup: all packages present"
  ensure_locale
  exit 0
fi

echo "setup: installing ${missing[*]}"
export DEBIAN_FRONTEND=noninteractive
$SUDO apt-get update
$SUDO apt-get install -y --no-install-recommends "${missing[@]}"
ensure_locale
