// A setup file parsed into the option store, and a traced job writing its log.
//
// Shows: a host session (file names and the file system), the setup-file parser handing
// each key and value to the option parsers, the options stored for the engine, then a job
// whose trace configuration sends the "Render" area up to level 3 into a log file: the
// level-5 message is filtered out, the others are written.
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include <ZYRHostKit.h>
#include <ZYRStd.h>

using namespace ZYRStd;

// Every pair goes to the option parsers; each takes the keys it knows.
class Options : public IZYRConfigParserCBProc {
public:
    Options() { ZYRFillDefaultMTOptions(mt); }
    void proc(const char* key, const char* value) override {
        std::printf("setup file: %s = %s\n", key, value);
        ZYRParseMTOptions(&mt, key, value);
    }
    sMTOptions mt;
};

int main() {
    tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    const char* tmp = std::getenv("TMPDIR");
    char dir[512];
    std::snprintf(dir, sizeof dir, "%s/zyrstd-example-XXXXXX", tmp && *tmp ? tmp : "/tmp");
    if (!mkdtemp(dir))
        return 1;
    const std::string setupPath = std::string(dir) + "/engine.cfg";
    const std::string logPath = std::string(dir) + "/trace.log";
    std::ofstream(setupPath) << "# threads of the renderer\nNumMTRThreads = 3\n"
                                "MTRThreshold=250000\n";
    int status = 1;
    {
        ZYRHostKit::HostSession session;
        Options options;
        ParseConfigData(reinterpret_cast<unsigned char*>(const_cast<char*>(setupPath.c_str())),
                        ZYRPublic::kZYRConfigDataFilePath,
                        static_cast<unsigned int>(setupPath.size()), options);
        ZYRSetMTOptions(options.mt);
        std::printf("stored: %d renderer threads, threshold %d\n", ZYRGetMTOptions().numMTRThreads,
                    ZYRGetMTOptions().mtrThreshold);

        CZYRDict render, config, params;
        render.set(CZYRUniString("All"), 3);
        config.set(CZYRUniString("Render"), render);
        config.set(CZYRUniString("Path"),
                   CZYRUniString(ZYRHostKit::utf8ToUTF16(logPath.c_str()).c_str()));
        params.set(CZYRUniString("JPJobID"), 42);
        params.set(CZYRUniString("ZYRTraceMsg"), config);
        {
            CZYRTraceMsg trace(ZYRHostKit::makeHostJob(42, params.getImpl()));
            const CZYRUniString area("Render"), category("Bands");
            trace.traceMsg(area, category, ZYRPublic::kZYRTraceMsgLevel2, "band 1 of 2 done");
            trace.traceMsg(area, category, ZYRPublic::kZYRTraceMsgLevel5, "too detailed: filtered");
            trace.traceMsg(area, category, ZYRPublic::kZYRTraceMsgLevel3, "band 2 of 2 done");
        }
        closeTraceLogPath();
        std::ifstream log(logPath);
        int messages = 0;
        for (std::string line; std::getline(log, line);) {
            messages += line.starts_with("<ZYRTrace>");
            std::printf("trace log | %s\n", line.c_str());
        }
        status = messages == 2 && ZYRGetMTOptions().numMTRThreads == 3 ? 0 : 1;
    }
    std::remove(logPath.c_str());
    std::remove(setupPath.c_str());
    ::rmdir(dir);
    return status;
}
