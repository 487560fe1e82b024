#include "ClientFixture.h"
#include "rox/RoxActivity.h"
#include "vkbus/LqxIpc.h"

namespace {

// A module that needs the client, by a name before all others.
std::vector<bool> runningG;

void Look() {
    runningG = {RoxActivity::initInfo.FRunning(), LqxIpc::initInfo.FRunning(),
                VkLocalorvoClient::initInfo.FRunning()};
}
unsigned Start(RoxMempool*) {
    Look();
    return 0;
}

}  // namespace

class ModuleTest : public ClientTest {
 protected:
    ModuleTest() { RoxInitInfo::StopAll(); }
};

TEST_F(ModuleTest, TheRuntimeStartsAndStopsTheClient) {
    EXPECT_STREQ("VkLocalorvoClient", VkLocalorvoClient::initInfo.GetName());
    ASSERT_EQ(0u, RoxInitInfo::StartAll(&pool));
    EXPECT_EQ(Lines{}, bus.Calls());
    EXPECT_TRUE(VkLocalorvoClient::initInfo.FRunning());
    EXPECT_NE(nullptr, VkLocalorvoClient::Get());
    RoxInitInfo::StopAll();
    EXPECT_FALSE(VkLocalorvoClient::initInfo.FRunning());
    EXPECT_EQ(nullptr, VkLocalorvoClient::Get());
    EXPECT_EQ((Lines{"open", "session", "hello", "close session", "close"}), bus.Calls());
}

TEST_F(ModuleTest, ItRunsAfterTheActivitiesAndTheBus) {
    RoxInitInfo* const dependencies[] = {&VkLocalorvoClient::initInfo};
    const RoxInitInfo user("AModuleThatNeedsTheClient", &Start, &Look, 1, dependencies, 0, nullptr);
    for (int round = 0; round < 2; ++round) {
        ASSERT_EQ(0u, RoxInitInfo::StartAll(&pool));
        EXPECT_EQ(std::vector<bool>(3, true), runningG);
        runningG.clear();
        SendAsync(VkLocalorvoClient::Get(), true);
        RoxInitInfo::StopAll();
        EXPECT_EQ(std::vector<bool>(3, true), runningG);
    }
}
