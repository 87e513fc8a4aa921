#include <gtest/gtest.h>

#include <dlfcn.h>
#include <sys/resource.h>
#include <unistd.h>

#include <atomic>
#include <csignal>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <thread>

#include <nlohmann/json.hpp>

#include "Kelvrin.h"
#include "TestSupport.h"

using Lines = std::vector<std::string>;

namespace {

std::vector<Lines> sessions(const std::string& folder) {
    std::vector<Lines> out;
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        if (entry.path().extension() != ".jsonl")
            continue;
        out.emplace_back();
        std::ifstream in(entry.path());
        for (std::string line; std::getline(in, line);) {
            nlohmann::json object = nlohmann::json::parse(line);
            EXPECT_TRUE(object["time"].is_number()) << line;
            object.erase("time");
            out.back().push_back(object.dump());
        }
    }
    return out;
}

} // namespace

TEST(KelvrinTest, SessionFileHoldsEveryCallAsOneLine) {
    void* const lib = dlopen(ZYRSTD_KELVRIN, RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(lib, nullptr) << dlerror();
    const auto get = [&](const char* name) { return dlsym(lib, name); };
    const auto setOptIn = reinterpret_cast<UTSetOptInProc>(get("UTSetOptIn"));
    const auto start = reinterpret_cast<UTStartSessionProc>(get("UTStartSession"));
    const auto addToSession = reinterpret_cast<UTAddToSessionProc>(get("UTAddToSession"));
    const auto newGroup = reinterpret_cast<UTNewDataGroupProc>(get("UTNewDataGroup"));
    const auto addToGroup = reinterpret_cast<UTAddToGroupProc>(get("UTAddToGroup"));
    const auto logEvent = reinterpret_cast<UTLogEventProc>(get("UTLogEvent"));
    const auto close = reinterpret_cast<UTCloseSessionProc>(get("UTCloseSession"));
    ASSERT_TRUE(setOptIn && start && addToSession && newGroup && addToGroup && logEvent && close);
    zyrtest::TempDir dir;
    const std::string folder = dir.file("deep/logs");

    setOptIn(0);
    Kelvrin* session = nullptr;
    start(session, "Print", "P", "1.2.3.4", "1.2", "", folder.c_str());
    ASSERT_NE(session, nullptr);
    int group = 7;
    newGroup(session, "G", "", "G", group, nullptr, 0);
    close(session);
    EXPECT_TRUE(group == 0 && session == nullptr && !std::filesystem::exists(folder));

    setOptIn(1);
    start(session, "Print", "P", "1.2.3.4", "1.2", nullptr, folder.c_str());
    ASSERT_NE(session, nullptr);
    addToSession(session, "host", "h1");
    newGroup(session, "JobInfo", "", "JobInfo", group, nullptr, 0);
    newGroup(session, "Second", nullptr, "S", group, nullptr, 0);
    addToGroup(session, group, "Quote\"\n", "caf\xc3\xa9 \xff");
    unsigned char data[] = {1, 255};
    logEvent(session, "Job", "", "TextAntiAliasing", data, 2);
    close(session);
    const std::vector<Lines> expected = {
        {R"({"folder":")" + folder +
             R"(","kind":"Print","product":"P","reserved":null,"short_version":"1.2",)"
             R"("type":"session_start","version":"1.2.3.4"})",
         R"({"key":"host","type":"session_value","value":"h1"})",
         R"({"data":[],"display_name":"JobInfo","group":0,"name":"JobInfo","subname":"","type":"group"})",
         R"({"data":[],"display_name":"S","group":1,"name":"Second","subname":null,"type":"group"})",
         "{\"group\":1,\"key\":\"Quote\\\"\\n\",\"type\":\"value\",\"value\":\"caf\xc3\xa9 "
         "\xef\xbf\xbd\"}", // not UTF-8: U+FFFD
         R"({"category":"Job","data":[1,255],"name":"TextAntiAliasing","subcategory":"",)"
         R"("type":"event"})",
         R"({"type":"session_close"})"}};
    EXPECT_EQ(sessions(folder), expected);

    zyrtest::writeFile(dir.file("plain"), "x");
    for (const char* product : {"P", "../P", "a/b"}) {
        start(session, "Print", product, "1", "1", "",
              (product[0] == 'P' ? dir.file("plain") + "/logs" : folder).c_str());
        EXPECT_EQ(session, nullptr) << product << ": no folder, or a name that leaves it";
    }

    // Names already taken (another session in this second, a planted link) are passed over;
    // what they point to is left alone.
    const std::string taken = dir.file("taken");
    std::filesystem::create_directories(taken);
    const std::time_t now = std::time(nullptr);
    for (std::time_t t = now; t <= now + 1; ++t) {
        char stamp[32];
        std::strftime(stamp, sizeof stamp, "%Y%m%dT%H%M%SZ", std::gmtime(&t));
        for (int n = 0; n < 10; ++n)
            std::filesystem::create_symlink(dir.file("plain"), taken + "/P-" + stamp + "-" +
                                                                   std::to_string(getpid()) + "-" +
                                                                   std::to_string(n) + ".jsonl");
    }
    testing::internal::CaptureStderr();
    start(session, "Print", "P", "1", "1", "", taken.c_str());
    close(session);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "")
        << "a session that went well closes quietly";
    EXPECT_EQ(zyrtest::readFile(dir.file("plain")), "x");
    int files = 0;
    for (const auto& entry : std::filesystem::directory_iterator(taken))
        files += !entry.is_symlink();
    EXPECT_EQ(files, 1);

    // Lines carry their times in order, though a long line is still being formatted.
    start(session, "Print", "", "1", "1", "", dir.file("order").c_str());
    std::atomic<bool> done{false};
    std::thread longLine([&] {
        addToGroup(session, 0, "long", std::string(4 << 20, 'x').c_str());
        done = true;
    });
    while (!done)
        addToSession(session, "short", "x");
    longLine.join();
    close(session);
    const std::filesystem::path order =
        std::filesystem::directory_iterator(dir.file("order"))->path();
    EXPECT_TRUE(order.filename().string().starts_with("unknown-")) << "no product name given";
    std::ifstream in(order);
    long long last = 0;
    for (std::string line; std::getline(in, line);) {
        const long long time = nlohmann::json::parse(line)["time"];
        EXPECT_LE(last, time);
        last = time;
    }

    // A write that fails (a full disk, here a file-size limit) is reported at close; the
    // report goes through a pipe, which the limit does not cut.
    EXPECT_EXIT(
        {
            int report[2];
            if (pipe(report) != 0 || dup2(report[1], 2) < 0)
                std::_Exit(2);
            std::signal(SIGXFSZ, SIG_IGN);
            rlimit limit;
            limit.rlim_cur = limit.rlim_max = 1;
            setrlimit(RLIMIT_FSIZE, &limit);
            ::close(0); // the session file may get descriptor 0 too
            start(session, "Print", "P", "1", "1", "", dir.file("full").c_str());
            close(session);
            ::close(report[1]);
            ::close(2); // the pipe's last writer: a silent close reads as the end
            char text[512] = {};
            const ssize_t got = read(report[0], text, sizeof text - 1);
            std::_Exit(got > 0 && std::strstr(text, ": File too large: 2 records lost\n") ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
    setOptIn(0);
    dlclose(lib);
}
