# The Debian packages that each step needs; read by ./call, ./check and .ci/run.
BUILD_LIBRARIES="libavcodec-dev libavformat-dev libavutil-dev libcli11-dev libhwy-dev libpng-dev libswscale-dev nlohmann-json3-dev"
BUILD_PACKAGES="cmake g++ ninja-build pkg-config $BUILD_LIBRARIES"
TEST_PACKAGES="$BUILD_PACKAGES binutils libgtest-dev"
CI_PACKAGES="$TEST_PACKAGES clang-14 clang-format-14 libclang-rt-14-dev"
FRAMES_BENCH_PACKAGES="libavfilter-dev libopencv-imgproc-dev libswscale-dev"
# For 32-bit ARM: tools of this system, and libraries of the other.
ARMHF_PACKAGES="cmake g++-arm-linux-gnueabihf ninja-build pkg-config qemu-user"
ARMHF_LIBRARIES="$BUILD_LIBRARIES libgtest-dev libstdc++6"
