/// \file
/// The interface of sub-allocators that the dynamic memory manager allocates from.
#pragma once

#include "ZYRStdExport.h"

namespace ZYRStd {

/// allocate and Free are its first two virtual operations; it is never deleted through
/// this interface, so it has no virtual destructor of its own.
class ZYRSTD_API I_VariableSizeAllocator {
public:
    /// `obtained` receives the bytes this call took from the supplier (0 when the block came
    /// from memory already held). Null when no memory could be had.
    virtual void* allocate(unsigned int size, unsigned int& obtained) = 0;
    /// Returns the bytes this call gave back to the supplier (0 when they were kept).
    virtual unsigned int Free(void* p) = 0;

protected:
    ~I_VariableSizeAllocator() = default;
};

} // namespace ZYRStd
