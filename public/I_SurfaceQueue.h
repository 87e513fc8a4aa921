/// \file
/// The renderer's surface queue, an engine object the memory manager asks to catch up.
#pragma once

namespace ZYRPublic {

/// The library calls only synchronize, the third virtual operation; the first two belong
/// to the engine's own reference protocol.
class I_SurfaceQueue {
public:
    /// Part of the engine's own reference protocol; the library never calls it.
    virtual void addRef() {}
    /// Part of the engine's own reference protocol; the library never calls it.
    virtual void release() {}
    /// Makes the renderer finish its queued work; the library always passes false.
    virtual bool synchronize(bool noWait) = 0;

protected:
    ~I_SurfaceQueue() = default;
};

} // namespace ZYRPublic
