// The input semaphore: whatever order it is used in, and while others use it. The executable's own functions
// for semaphores check that a semaphore exists when it is used, which neither the library nor a sanitizer
// notices, and pass the call on.
#include <dlfcn.h>
#include <semaphore.h>

#include <atomic>
#include <mutex>
#include <set>
#include <thread>

#include "omxbridge/omxbridge.h"
#include "tests/core/session_fixture.h"

namespace {

// The semaphores that exist. Locked over each call: what is used is not destroyed in between.
std::mutex g_lock;
std::set<sem_t*>& existing() {
  static auto& kExisting = *new std::set<sem_t*>;
  return kExisting;
}
// How often one was used that did not exist, or was made anew without having been destroyed.
std::atomic<int> g_misuses{0};

// The system's own function.
template <typename... Arguments>
int forward(const char* name, Arguments... arguments) {
  return reinterpret_cast<int (*)(Arguments...)>(dlsym(RTLD_NEXT, name))(arguments...);
}

}  // namespace

#define EXPORTED extern "C" __attribute__((visibility("default")))

EXPORTED int sem_init(sem_t* semaphore, int shared, unsigned int value) noexcept {
  const std::lock_guard<std::mutex> held(g_lock);
  if (!existing().insert(semaphore).second) ++g_misuses;
  return forward("sem_init", semaphore, shared, value);
}

EXPORTED int sem_post(sem_t* semaphore) noexcept {
  const std::lock_guard<std::mutex> held(g_lock);
  if (!existing().contains(semaphore)) ++g_misuses;
  return forward("sem_post", semaphore);
}

EXPORTED int sem_destroy(sem_t* semaphore) noexcept {
  const std::lock_guard<std::mutex> held(g_lock);
  if (existing().erase(semaphore) == 0) ++g_misuses;
  return forward("sem_destroy", semaphore);
}

namespace {

using namespace omxtest;

TEST(InputSemaphore, MayBeUsedInAnyOrderAndPostedWhileItComesAndGoes) {
  const auto post = [] { return semaphoreEmptyBufferPost(nullptr, nullptr); };
  const auto setUp = [] { return omx_setup_input_semaphore(nullptr); };
  int (*const operations[])() = {post, setUp, omx_teardown_input_semaphore};
  std::atomic<bool> done{false};
  std::thread poster([&] {
    while (!done) post();
  });
  // Every sequence of five, among them posts before set-up, set-up twice and teardown of nothing.
  for (int sequence = 0; sequence < 3 * 3 * 3 * 3 * 3; ++sequence) {
    for (int rest = sequence, i = 0; i < 5; ++i, rest /= 3) EXPECT_EQ(operations[rest % 3](), 0);
  }
  done = true;
  poster.join();
  EXPECT_EQ(g_misuses, 0);
}

using InputSemaphoreTest = SessionTest;

TEST_F(InputSemaphoreTest, TakesThePlaceOfTheInputCallback) {
  ASSERT_EQ(createEncoder(), 0);
  EXPECT_EQ(omx_setup_input_semaphore(_session.get()), 0);
  EXPECT_EQ(_session->_inputCallback, semaphoreEmptyBufferPost);
  EXPECT_EQ(_session->_inputCallbackContext, nullptr);
  EXPECT_EQ(omx_teardown_input_semaphore(), 0);
  ASSERT_EQ(init(), 0);
  feedThrough("a frame");  // comes back after the teardown
  destroy();
  EXPECT_EQ(g_misuses, 0);
}

}  // namespace
