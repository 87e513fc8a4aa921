// Our telemetry library: the JSON Lines session file, opt-in, and the whole road from an
// analytics record through the manager and the logger into the file.
#include <gtest/gtest.h>

#include <dlfcn.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include <nlohmann/json.hpp>

#include "Kelvrin.h"
#include "TestSupport.h"
#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/instrument/CZYRAnalyticsData.h"
#include "zyr/std/instrument/IImpZYRAnalyticsManager.h"

using namespace ZYRStd;
using nlohmann::json;

namespace {

std::vector<std::filesystem::path> sessionFiles(const std::string& folder) {
    std::vector<std::filesystem::path> files;
    if (std::filesystem::exists(folder))
        for (const auto& entry : std::filesystem::directory_iterator(folder))
            if (entry.path().extension() == ".jsonl")
                files.push_back(entry.path());
    return files;
}

std::vector<json> readLines(const std::filesystem::path& file) {
    std::vector<json> lines;
    std::ifstream in(file);
    for (std::string line; std::getline(in, line);)
        lines.push_back(json::parse(line));
    return lines;
}

// The library loaded by path, as a host would see it.
struct Library {
    Library() : handle(dlopen(ZYRSTD_KELVRIN, RTLD_NOW | RTLD_LOCAL)) {}
    ~Library() {
        if (handle)
            dlclose(handle);
    }
    template <class F> F get(const char* name) { return reinterpret_cast<F>(dlsym(handle, name)); }
    void* handle;
};

} // namespace

TEST(KelvrinTest, SessionFileHoldsEveryCallAsOneLine) {
    Library lib;
    ASSERT_NE(lib.handle, nullptr) << dlerror();
    auto setOptIn = lib.get<UTSetOptInProc>("UTSetOptIn");
    auto start = lib.get<UTStartSessionProc>("UTStartSession");
    auto addToSession = lib.get<UTAddToSessionProc>("UTAddToSession");
    auto newGroup = lib.get<UTNewDataGroupProc>("UTNewDataGroup");
    auto addToGroup = lib.get<UTAddToGroupProc>("UTAddToGroup");
    auto logEvent = lib.get<UTLogEventProc>("UTLogEvent");
    auto close = lib.get<UTCloseSessionProc>("UTCloseSession");
    ASSERT_TRUE(setOptIn && start && addToSession && newGroup && addToGroup && logEvent && close);
    zyrtest::TempDir dir;
    const std::string folder = dir.file("deep/logs");

    // Opted out: a session that records nothing and makes no file.
    setOptIn(0);
    Kelvrin* session = nullptr;
    start(session, "Print", "P", "1.2.3.4", "1.2", "", folder.c_str());
    ASSERT_NE(session, nullptr);
    int group = 7;
    newGroup(session, "G", "", "G", group, nullptr, 0);
    EXPECT_EQ(group, 0);
    close(session);
    EXPECT_EQ(session, nullptr);
    EXPECT_TRUE(sessionFiles(folder).empty());

    setOptIn(1);
    start(session, "Print", "P", "1.2.3.4", "1.2", nullptr, folder.c_str());
    ASSERT_NE(session, nullptr);
    addToSession(session, "host", "h1");
    newGroup(session, "JobInfo", "", "JobInfo", group, nullptr, 0);
    EXPECT_EQ(group, 0);
    addToGroup(session, group, "Quote\"\n", "caf\xc3\xa9");
    unsigned char data[] = {1, 255};
    logEvent(session, "Job", "", "TextAntiAliasing", data, 2);
    close(session);

    const auto files = sessionFiles(folder);
    ASSERT_EQ(files.size(), 1u);
    const auto lines = readLines(files[0]);
    ASSERT_EQ(lines.size(), 6u);
    EXPECT_EQ(lines[0]["type"], "session_start");
    EXPECT_EQ(lines[0]["version"], "1.2.3.4");
    EXPECT_TRUE(lines[0]["reserved"].is_null());
    EXPECT_EQ(lines[1]["type"], "session_value");
    EXPECT_EQ(lines[1]["value"], "h1");
    EXPECT_EQ(lines[2]["type"], "group");
    EXPECT_EQ(lines[2]["name"], "JobInfo");
    EXPECT_EQ(lines[3]["type"], "value");
    EXPECT_EQ(lines[3]["group"], 0);
    EXPECT_EQ(lines[3]["key"], "Quote\"\n");
    EXPECT_EQ(lines[3]["value"], "caf\xc3\xa9");
    EXPECT_EQ(lines[4]["type"], "event");
    EXPECT_EQ(lines[4]["data"], json::array({1, 255}));
    EXPECT_EQ(lines[5]["type"], "session_close");
    for (const auto& line : lines)
        EXPECT_TRUE(line["time"].is_number());

    // A folder that cannot be made: no session.
    zyrtest::writeFile(dir.file("plain"), "x");
    start(session, "Print", "P", "1", "1", "", (dir.file("plain") + "/logs").c_str());
    EXPECT_EQ(session, nullptr);
    setOptIn(0);
}

// The library the logger finds by name is ours, beside libZYRStd; records reach its file.
TEST(KelvrinTest, RecordsReachTheSessionFile) {
    zyrtest::TempDir dir;
    const std::u16string folder(dir.path().begin(), dir.path().end());
    ZYRSetAnalyticsLogFolder(folder.c_str());
    ZYRSetAnalyticsActive(true);
    ASSERT_TRUE(ZYRAnalyticsManagerInit());
    ASSERT_TRUE(ZYRIsAnalyticsActive()) << "libKelvrin.so was not found beside the library";
    CZYRAnalyticsData record;
    record.set(CZYRUniString("DataGroupName"), CZYRUniString("DripSessionInfo"));
    record.set(CZYRUniString("NumWorkers"), 3u);
    record.finalize();
    // Logged before termination: wait until the worker wrote the value.
    const auto logged = [&] {
        const auto files = sessionFiles(dir.path());
        return files.size() == 1 && readLines(files[0]).size() >= 3;
    };
    for (int i = 0; i < 10000 && !logged(); ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    ZYRAnalyticsManagerTerm();
    ZYRSetAnalyticsActive(false);
    ZYRSetAnalyticsLogFolder(nullptr);

    const auto files = sessionFiles(dir.path());
    ASSERT_EQ(files.size(), 1u);
    const auto lines = readLines(files[0]);
    ASSERT_GE(lines.size(), 4u);
    EXPECT_EQ(lines[0]["folder"], dir.path());
    EXPECT_EQ(lines[1]["name"], "DripSessionInfo");
    EXPECT_EQ(lines[2]["key"], "NumWorkers");
    EXPECT_EQ(lines[2]["value"], "3");
    EXPECT_EQ(lines.back()["type"], "session_close");
}
