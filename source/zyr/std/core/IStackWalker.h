/// \file
/// Where a call-stack recorder plugs into the memory tracker; the library ships a stub.
#pragma once

#include "ZYRStdExport.h"

namespace ZYRStd {

/// Records call stacks for the memory tracker's leak report; called under the tracker's lock.
class ZYRSTD_API IStackWalker {
public:
    virtual ~IStackWalker();
    /// Returns an identifier of the current stack, 0 for none.
    virtual unsigned int capture(unsigned int skip, unsigned int depthLow, unsigned int depthHigh,
                                 unsigned int size) = 0;
    /// A block of `size` bytes recorded under `id` was freed.
    virtual void release(unsigned int id, unsigned int size) = 0;
    /// A block recorded under `id` changed size.
    virtual void resize(unsigned int id, unsigned int oldSize, unsigned int newSize) = 0;
    /// Writes the stack `id` as text into `buffer` of `bufferSize` bytes.
    virtual void describe(unsigned int id, char* buffer, unsigned int bufferSize) = 0;
};

/// Records nothing: every identifier is 0 and no stack is ever printed.
class ZYRSTD_API IImpStackWalkerStub final : public IStackWalker {
public:
    /// The walker the tracker installs; its CZYRSmartPtr owns it.
    static IStackWalker* create();
    ~IImpStackWalkerStub() override;
    unsigned int capture(unsigned int, unsigned int, unsigned int, unsigned int) override {
        return 0;
    }
    /// Nothing to forget.
    void release(unsigned int, unsigned int) override {}
    /// Nothing to follow.
    void resize(unsigned int, unsigned int, unsigned int) override {}
    /// Writes nothing.
    void describe(unsigned int, char*, unsigned int) override {}
};

} // namespace ZYRStd
