# shellcheck shell=sh disable=SC2034
# The Debian packages that each step needs; read by ./call, ./check, .ci/run and the other scripts.
BUILD_LIBRARIES="libavcodec-dev libavformat-dev libavutil-dev libcli11-dev libhwy-dev libpng-dev libswscale-dev nlohmann-json3-dev"
BUILD_PACKAGES="cmake g++ ninja-build pkg-config $BUILD_LIBRARIES"
TEST_PACKAGES="$BUILD_PACKAGES binutils libgtest-dev python3"
PACKAGE_PACKAGES="dpkg-dev file"
REFERENCE_PACKAGES="doxygen"
FUZZ_PACKAGES="clang-14 libclang-rt-14-dev"
CI_PACKAGES="$TEST_PACKAGES $PACKAGE_PACKAGES $REFERENCE_PACKAGES $FUZZ_PACKAGES clang-format-14"
FRAMES_BENCH_PACKAGES="libavfilter-dev libopencv-imgproc-dev libswscale-dev"
# For 32-bit ARM: tools of this system, and libraries of the other.
ARMHF_PACKAGES="cmake g++-arm-linux-gnueabihf ninja-build pkg-config qemu-user"
ARMHF_LIBRARIES="$BUILD_LIBRARIES libgtest-dev libstdc++6"
