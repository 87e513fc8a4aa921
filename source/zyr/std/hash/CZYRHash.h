/// \file
/// Incremental MD5 digests behind CZYRHash, and process-unique 64-bit identifiers.
#pragma once

#include <array>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"

namespace ZYRStd {

/// A 16-byte MD5 digest.
using ZYRDigest = std::array<unsigned char, 16>;

/// An incremental digest: feed bytes with update, then take the digest. One thread at a time.
class ZYRSTD_API CZYRHash : public CZYRClientBase {
public:
    ~CZYRHash() override;
    /// Adds `length` bytes; throws kZYRErrorInvalidFuncCall once the digest has been taken.
    virtual void update(void const* data, unsigned int length) = 0;
    /// The first call finishes the digest; every call returns the same 16 bytes.
    virtual ZYRDigest getDigest() = 0;
};

/// A new MD5 digest, the second form already fed `length` bytes of `data`. The caller owns
/// the object and deletes it; null when the allocation fails. Any thread.
///@{
ZYRSTD_API CZYRHash* createMD5Hash();
ZYRSTD_API CZYRHash* createMD5Hash(unsigned char* data, unsigned int length);
///@}

} // namespace ZYRStd
