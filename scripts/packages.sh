# The Debian packages that each step needs; read by ./call, ./check and .ci/run.
BUILD_PACKAGES="cmake g++ ninja-build pkg-config libavcodec-dev libavformat-dev libavutil-dev libcli11-dev libhwy-dev libpng-dev libswscale-dev nlohmann-json3-dev"
TEST_PACKAGES="$BUILD_PACKAGES binutils libgtest-dev"
FUZZ_PACKAGES="clang-14 libclang-rt-14-dev"
CI_PACKAGES="$TEST_PACKAGES $FUZZ_PACKAGES clang-format-14"
FRAMES_BENCH_PACKAGES="libavfilter-dev libopencv-imgproc-dev libswscale-dev"
