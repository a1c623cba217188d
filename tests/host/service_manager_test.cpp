#include <gtest/gtest.h>
#include <stdlib.h>

#include <string>
#include <thread>
#include <vector>

#include <binder/IServiceManager.h>
#include <media/IMediaPlayerService.h>
#include <media/IOMX.h>
#include <omxhost/log.h>
#include <omxhost/services.h>

#include "tests/host/new_process.h"

namespace {

using android::defaultServiceManager;
using android::IBinder;
using android::sp;
using android::String16;

class PlayerService : public android::BnMediaPlayerService {
 public:
  sp<android::IOMX> getOMX() override { return nullptr; }
};

sp<IBinder> lookUp(const char* name) {
  return defaultServiceManager()->getService(String16(name));
}

TEST(ServiceManager, FindsReplacesListsAndRemoves) {
  const sp<IBinder> first = (new PlayerService())->asBinder(), second = (new PlayerService())->asBinder();
  const auto manager = defaultServiceManager();
  EXPECT_EQ(manager->addService(String16("test.c"), nullptr), android::BAD_VALUE);
  for (const sp<IBinder>& service : {first, second}) {
    EXPECT_EQ(manager->addService(String16("test.b"), service), android::OK);
    EXPECT_EQ(lookUp("test.b"), service);
  }
  manager->addService(String16("test.a"), first);
  const android::Vector<String16> names = manager->listServices();
  ASSERT_EQ(names.size(), 2U);
  EXPECT_TRUE(names[0] == String16("test.a") && names[1] == String16("test.b"));
  for (const bool present : {true, false}) EXPECT_EQ(omxhost::removeService(String16("test.b")), present);
  EXPECT_EQ(manager->checkService(String16("test.b")), nullptr);
  EXPECT_TRUE(omxhost::removeService(String16("test.a")));
}

TEST(ServiceManager, LoadsTheMediaServerOnceForAllWhoAskTogether) {
  EXPECT_IN_NEW_PROCESS(
      [] {
        setenv("OMXBRIDGE_MEDIASERVER", MEDIA_SERVER, 1);
        // Nothing is loaded for another name, while that is switched off, or where somebody serves.
        EXPECT_TRUE(omxhost::setLoadOnDemand(false));
        EXPECT_EQ(lookUp("media.player"), nullptr);
        EXPECT_FALSE(omxhost::setLoadOnDemand(true));
        const sp<IBinder> own = (new PlayerService())->asBinder();
        defaultServiceManager()->addService(String16("media.player"), own);
        EXPECT_EQ(lookUp("media.player"), own);
        EXPECT_TRUE(omxhost::removeService(String16("media.player")));
        EXPECT_EQ(lookUp("another"), nullptr);
        std::vector<sp<IBinder>> found(8);
        {
          std::vector<std::jthread> threads;
          for (auto& each : found) threads.emplace_back([&each] { each = lookUp("media.player"); });
        }
        EXPECT_NE(found[0], nullptr);
        EXPECT_EQ(found, std::vector<sp<IBinder>>(found.size(), found[0]));
        // Who takes the service away means it: it is not started again.
        EXPECT_TRUE(omxhost::removeService(String16("media.player")));
        EXPECT_EQ(lookUp("media.player"), nullptr);
      },
      testing::Eq(""));
}

TEST(ServiceManager, WarnsOnceWhereThereIsNoMediaServer) {
  EXPECT_IN_NEW_PROCESS(
      [] {
        unsetenv("OMXBRIDGE_LOG");
        setenv("OMXBRIDGE_MEDIASERVER", LIBRARY_WITHOUT_ENTRY_POINT, 1);
        EXPECT_EQ(lookUp("media.player"), nullptr);
        EXPECT_EQ(lookUp("media.player"), nullptr);
      },
      testing::ContainsRegex("^W/omxhost: no media server: [^\n]*omxhost_media_server_start[^\n]*\n$"));
}

}  // namespace
