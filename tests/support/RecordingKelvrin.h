#pragma once

#include <dlfcn.h>

#include <chrono>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace zyrtest {

class RecordingKelvrin {
public:
    static RecordingKelvrin& get() {
        static RecordingKelvrin instance;
        return instance;
    }

    std::vector<std::string> take() {
        std::vector<std::string> calls;
        take_(calls);
        return calls;
    }
    // While held, every library call waits (the library is "slow") until released.
    void hold(bool held) { hold_(held); }
    void refuseSessions(bool refuse) { refuse_(refuse); }
    // Returns once a call waits at the hold.
    void awaitHeldCall() {
        while (waiting_() == 0)
            std::this_thread::yield();
    }
    std::vector<std::string> waitFor(size_t count) {
        std::vector<std::string> all;
        for (int i = 0; i < 10000 && all.size() < count; ++i) {
            for (auto& call : take())
                all.push_back(std::move(call));
            if (all.size() < count)
                std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        return all;
    }

private:
    RecordingKelvrin() : handle_(dlopen(ZYRSTD_RECORDING_KELVRIN, RTLD_NOW | RTLD_GLOBAL)) {
        if (!handle_)
            throw std::runtime_error(dlerror());
        symbol(take_, "RecordingTakeCalls");
        symbol(hold_, "RecordingHold");
        symbol(refuse_, "RecordingRefuseSessions");
        symbol(waiting_, "RecordingWaiting");
    }
    template <class F> void symbol(F& f, const char* name) {
        f = reinterpret_cast<F>(dlsym(handle_, name));
        if (!f)
            throw std::runtime_error(name);
    }

    void* handle_ = nullptr;
    void (*take_)(std::vector<std::string>&) = nullptr;
    void (*hold_)(bool) = nullptr;
    void (*refuse_)(bool) = nullptr;
    int (*waiting_)() = nullptr;
};

} // namespace zyrtest
