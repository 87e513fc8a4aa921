// Incremental MD5 digests behind CZYRHash, and process-unique 64-bit identifiers.
#pragma once

#include <array>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"

namespace ZYRStd {

using ZYRDigest = std::array<unsigned char, 16>;

class ZYRSTD_API CZYRHash : public CZYRClientBase {
public:
    ~CZYRHash() override;
    // Throws kZYRErrorInvalidFuncCall once the digest has been taken.
    virtual void update(void const* data, unsigned int length) = 0;
    // The first call finishes the digest; every call returns the same 16 bytes.
    virtual ZYRDigest getDigest() = 0;
};

// The caller owns the object and deletes it; null when the allocation fails.
ZYRSTD_API CZYRHash* createMD5Hash();
ZYRSTD_API CZYRHash* createMD5Hash(unsigned char* data, unsigned int length);

} // namespace ZYRStd
