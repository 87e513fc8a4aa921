/// \file
/// Value wrappers over the stream interfaces: CZYRBaseStream, CZYRFStream, CZYRMemMapFStream.
#pragma once

#include "IZYRStream.h"
#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"

namespace ZYRStd {

class CZYRFileName;
class CZYRUniString;

/// Holds one reference to a stream and forwards every call to it. Forwarding on an empty
/// wrapper raises kZYRErrorInvalidObject; isValid and isShared test for emptiness.
class ZYRSTD_API CZYRBaseStream : public CZYRClientBase {
public:
    CZYRBaseStream() = default;
    /// Shares the stream: one more reference.
    CZYRBaseStream(const CZYRBaseStream& other) = default;
    /// Shares the other's stream and releases the one held before.
    CZYRBaseStream& operator=(const CZYRBaseStream& other) = default;
    /// Shares `stream`: one more reference.
    CZYRBaseStream(const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>& stream);
    /// A memory stream from the installed file system.
    CZYRBaseStream(unsigned int mode, unsigned int capacity, void* buffer);
    ~CZYRBaseStream() override;

    /// Forwards to the same operation of ZYRStreams::IZYRStream; throws
    /// kZYRErrorInvalidObject on an empty wrapper.
    ///@{
    void reOpen(unsigned int mode);
    unsigned int read(void* buf, unsigned int size, unsigned int count,
                      ZYRPublic::eZYRErrorType& err);
    unsigned int read(void* buf, unsigned int size, unsigned int count);
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::eZYRErrorType& err);
    unsigned int write(const void* buf, unsigned int size, unsigned int count);
    unsigned long long setPos(const unsigned long long& pos);
    unsigned long long getPos();
    void setEOF();
    unsigned long long getEOF();
    unsigned long long getSize();
    unsigned long long getCapacity();
    unsigned int getAccessMode();
    ///@}

    /// True when a stream is held.
    bool isValid() const { return static_cast<bool>(stream_); }
    /// True when the stream has other references.
    bool isShared() const { return stream_ && stream_->isShared(); }
    /// The held reference, borrowed.
    operator const CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream>&() const { return stream_; }

private:
    ZYRStreams::IZYRStream& stream() const;

    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> stream_;
};

/// A second reference, typed as a file stream, to the same object.
class ZYRSTD_API CZYRFStream : public CZYRBaseStream {
public:
    CZYRFStream() = default;
    /// Shares the stream: one more reference.
    CZYRFStream(const CZYRFStream& other) = default;
    /// Shares the other's stream and releases the one held before.
    CZYRFStream& operator=(const CZYRFStream& other) = default;
    /// Shares `stream`: one more reference.
    CZYRFStream(const CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream>& stream);
    /// A file that cannot be opened still gives a stream, whose isOpen is false.
    CZYRFStream(const CZYRFileName& name, unsigned int mode);
    ~CZYRFStream() override;

    /// Forwards to the same operation of ZYRStreams::IZYRFStream; throws
    /// kZYRErrorInvalidObject on an empty wrapper.
    ///@{
    bool isOpen();
    void close();
    void flush();
    const CZYRUniString& getFilePath();
    ///@}

private:
    ZYRStreams::IZYRFStream& fstream() const;

    CZYRSmartZYRRefPtr<ZYRStreams::IZYRFStream> fstream_;
};

/// A third reference, typed as a mapped file stream.
class ZYRSTD_API CZYRMemMapFStream : public CZYRFStream {
public:
    CZYRMemMapFStream() = default;
    /// Shares the stream: one more reference.
    CZYRMemMapFStream(const CZYRMemMapFStream& other) = default;
    /// Shares the other's stream and releases the one held before.
    CZYRMemMapFStream& operator=(const CZYRMemMapFStream& other) = default;
    /// Shares `stream`: one more reference.
    CZYRMemMapFStream(const CZYRSmartZYRRefPtr<ZYRStreams::IZYRMemMapFStream>& stream);
    /// Maps `length` bytes of `name` from `offset` through the installed file system; throws
    /// what it raises.
    CZYRMemMapFStream(const CZYRFileName& name, unsigned int mode, const unsigned long long& offset,
                      unsigned int length);
    ~CZYRMemMapFStream() override;

    /// Forwards to the same operation of ZYRStreams::IZYRMemMapFStream; throws
    /// kZYRErrorInvalidObject on an empty wrapper.
    ///@{
    bool isMapped();
    void* getMapAttributes(unsigned long long& offset, unsigned int& length);
    ///@}

private:
    ZYRStreams::IZYRMemMapFStream& mstream() const;

    CZYRSmartZYRRefPtr<ZYRStreams::IZYRMemMapFStream> mstream_;
};

} // namespace ZYRStd
