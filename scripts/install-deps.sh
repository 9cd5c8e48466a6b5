#!/usr/bin/env bash
# Installs every Debian package the build, the tests and the viewer need.
# Idempotent: only missing packages are installed, and nothing is done when all are present.
set -euo pipefail

packages=(
  build-essential cmake ninja-build pkg-config clang clang-format libclang-rt-14-dev
  qtbase5-dev qtbase5-dev-tools libqt5opengl5-dev qtmultimedia5-dev libqt5svg5-dev
  qtdeclarative5-dev qtquickcontrols2-5-dev qml-module-qtquick2 qml-module-qtquick-controls2
  qml-module-qtquick-window2 qml-module-qtquick-layouts libqt5multimedia5-plugins
  libboost-dev libboost-program-options-dev libboost-filesystem-dev libboost-regex-dev
  libboost-thread-dev
  libebml-dev libmatroska-dev libturbojpeg0-dev libopenh264-dev libmagickwand-6.q16-dev
  librapidxml-dev
  libgtest-dev libgmock-dev libbenchmark-dev
  xvfb xauth libgl1-mesa-dri libglx-mesa0 mesa-utils
  ffmpeg python3 imagemagick gcovr
  desktop-file-utils appstream libxml2-utils shared-mime-info xdg-utils dpkg-dev libglib2.0-bin man-db
)

missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done
[ ${#missing[@]} -eq 0 ] && exit 0

echo "Installing: ${missing[*]}" >&2
sudo=""
if [ "$(id -u)" -ne 0 ]; then
  command -v sudo >/dev/null || { echo "Need root or sudo to install packages." >&2; exit 1; }
  sudo="sudo"
fi
export DEBIAN_FRONTEND=noninteractive
$sudo apt-get update -q
$sudo apt-get install -y -q --no-install-recommends "${missing[@]}"
