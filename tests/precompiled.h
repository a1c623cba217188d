#pragma once
// What most tests include, parsed once for all of them. Each test still includes what it uses: builds
// behind a compiler cache do without this.

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <vector>
