#include "platform/services/config_int.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/local_service.h"
#include "platform/services/log.h"
#include "support/recording_log.h"

#include <cstdlib>
#include <gtest/gtest.h>
#include <thread>
#include <vector>

namespace {

TEST(Log, WritesWholeLinesToTheRightOutlets) {
    const test::RecordingLog log;
    herc_printf("plain %d", 1);
    herc_printf(0, "level %d\n", 0);
    herc_printf(2, "dropped\n");
    Qx::setLogLevel(2);
    herc_printf(2, "level 2 \n");
    herc_printf(3, "dropped\n");
    Qx::setLogLevel(0);
    LogBoth("grave: %s\n", "news");
    EXPECT_EQ(log.log(), "plain 1\nlevel 0\nlevel 2 \ngrave: news\n");
    EXPECT_EQ(log.standardOutput(), "grave: news\n");
}

TEST(Log, NothingButGraveNewsReachesStandardErrorUnasked) {
    const auto before = Qx::setLogSink({});
    const auto outBefore = Qx::setStandardOutputSink([](std::string_view) {});
    testing::internal::CaptureStderr();
    herc_printf("chatter\n");
    LogBoth("an edit was lost\n");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "an edit was lost\n");
    testing::internal::CaptureStderr();
    Qx::setLogSink(Qx::standardErrorSink());
    herc_printf("asked for\n");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "asked for\n");
    // In a program without a sink the environment asks, when it starts.
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    ::setenv("QUILLMARCH_LOG", "1", 1);
    EXPECT_EXIT(Qx::setLogSink({}); herc_printf("told"); std::exit(0), testing::ExitedWithCode(0), "told");
    ::unsetenv("QUILLMARCH_LOG");
    Qx::setLogSink(before);
    Qx::setStandardOutputSink(outBefore);
}

TEST(Log, LinesOfThreadsAreNotMixed) {
    const test::RecordingLog log;
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([] {
            for (int i = 0; i < 100; ++i) {
                herc_printf("%s%s\n", "abcdefghij", "klmnopqrst");
            }
        });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    const auto lines = log.log().split('\n', true);
    EXPECT_EQ(lines.size(), 400u);
    for (const String& line : lines) {
        ASSERT_EQ(line, "abcdefghijklmnopqrst");
    }
}

TEST(ConfigInt, SetValuesGoBeforeTheEnvironmentAndThatBeforeTheDefault) {
    EXPECT_EQ(config_int("test_depth", 10), 10);
    ::setenv("QUILLMARCH_TEST_DEPTH", " 4", 1);
    EXPECT_EQ(config_int("Test_Depth", 10), 4);
    Qx::setConfigInt("TEST_depth", -1);
    EXPECT_EQ(config_int("test_depth", 10), -1);
    Qx::clearConfigInt("test_DEPTH");
    EXPECT_EQ(config_int("test_depth", 10), 4);
    for (const char* bad : {"", "4x", "99999999999", "1.5"}) {
        ::setenv("QUILLMARCH_TEST_DEPTH", bad, 1);
        EXPECT_EQ(config_int("test_depth", 10), 10) << bad;
    }
    ::unsetenv("QUILLMARCH_TEST_DEPTH");
    EXPECT_EQ(config_int(nullptr, 3), 3);
}

TEST(CurrentProject, NamesTheFilesOfStorableItemsOnly) {
    const Qx::CurrentProject before = Qx::currentProject();
    EXPECT_FALSE(before.user.empty());
    EXPECT_EQ(getFilenameForCookie(cookie("E0001000")), "") << "there is no folder yet";
    Qx::CurrentProject project = before;
    project.rootFolder = "/projects";
    project.project = cookie("P0002000");
    Qx::setCurrentProject(project);
    EXPECT_EQ(getFilenameForCookie(cookie("E0001000")), "/projects/P0002000/E0001000.qme");
    EXPECT_EQ(getFilenameForCookie(cookie(Cookie_Type::Edit, -5, 0)), "");
    EXPECT_EQ(getFilenameForCookie(invalid_cookie), "");
    EXPECT_EQ(getEditFilenameExt(false), "qme");
    Qx::setCurrentProject(before);
}

TEST(Network, SeatsHearEachOtherButNotThemselves) {
    const auto first = Qx::Network::LocalService::firstSeat();
    const auto second = first->anotherSeat();
    const auto stranger = Qx::Network::LocalService::firstSeat();
    std::vector<String> heard;
    const auto ear1 = first->listen([&](const auto& m) { heard.push_back("1:" + m.user); });
    auto ear2 = second->listen([&](const auto& m) { heard.push_back("2:" + m.user); });
    const auto ear3 = stranger->listen([&](const auto& m) { heard.push_back("3:" + m.user); });
    const Qx::Network::Message message{Qx::Network::EditWritten, cookie("E0001000"), "anna"};
    first->send(message);
    second->send({Qx::Network::EditBeingChanged, cookie("E0001000"), "ben"});
    EXPECT_EQ(heard, (std::vector<String>{"2:anna", "1:ben"}));
    ear2.reset();
    first->send(message);
    EXPECT_EQ(heard.size(), 2u);
}

} // namespace
