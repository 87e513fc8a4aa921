// A flushable cache client that gives memory back under pressure.
//
// Shows: a cache registering itself as a flushable memory client, a renderer registered as
// the surface queue, and an allocation that does not fit: the memory manager first lets the
// renderer catch up, then asks the caches to flush, and the allocation succeeds.
#include <cstdio>
#include <memory>

#include <I_SurfaceQueue.h>
#include <ZYRHostKit.h>
#include <ZYRStd.h>

using namespace ZYRStd;

constexpr unsigned int kMiB = 1u << 20;

// An engine cache: it holds one block and frees it when asked.
class ImageCache : public I_FlushableMemoryClient {
public:
    explicit ImageCache(unsigned int bytes) : block_(ZYRMalloc(bytes)), size_(bytes) {}
    ~ImageCache() override { ZYRFree(block_); }

    bool flushMemory(unsigned int bytesNeeded, unsigned int, eFlushMemorySeverity) override {
        std::printf("the image cache is asked for %u bytes and frees %u\n", bytesNeeded, size_);
        if (!block_)
            return false;
        ZYRFree(block_);
        block_ = nullptr;
        size_ = 0;
        return true;
    }
    unsigned int getFlushableMemorySize() override { return size_; }
    const char* getClientName() override { return "ImageCache"; }

private:
    void* block_;
    unsigned int size_;
};

// Stands in for the renderer: catching up frees the bands it has printed.
class Renderer : public ZYRPublic::I_SurfaceQueue {
public:
    explicit Renderer(unsigned int bytes) : bands_(ZYRMalloc(bytes)) {}
    ~Renderer() { ZYRFree(bands_); }
    bool synchronize(bool) override {
        std::puts("the renderer catches up and frees its printed bands");
        ZYRFree(bands_);
        bands_ = nullptr;
        return true;
    }

private:
    void* bands_;
};

int main() {
    tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    ZYRSetMemLimit(400ull * kMiB);
    ZYRStdInit_InitializeFlushableMemoryClientRegistry();
    // Only a thread that may block can wait for the renderer or ask caches to flush.
    SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("interpreter", true));
    int status = 1;
    {
        ImageCache cache(150 * kMiB);
        RegisterFlushableMemoryClient(&cache, false);
        Renderer renderer(100 * kMiB);
        RegisterSurfaceQueueInstance(&renderer);
        void* pages = ZYRMalloc(120 * kMiB); // 370 MiB of 400 are now in use

        void* block = ZYRDMMMalloc(200 * kMiB, "Interpreter", nullptr, nullptr, nullptr,
                                   ZYRPublic::eFlushMemorySeverityNormal);
        std::printf("200 MiB for the interpreter: %s; usage now %llu MiB\n",
                    block ? "granted" : "refused", GetMemUsage() / kMiB);
        status = block ? 0 : 1;

        ZYRFree(block);
        ZYRFree(pages);
        RegisterSurfaceQueueInstance(nullptr);
        UnregisterFlushableMemoryClient(&cache);
    }
    SetCZYRThreadSpecificPtr(nullptr);
    ZYRStdInit_TerminateFlushableMemoryClientRegistry();
    return status;
}
