// Value wrappers over the stream interfaces.
#include "zyr/std/io/CZYRBaseStream.h"

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/CZYRFileSys.h"

namespace ZYRStd {

using namespace ZYRStreams;

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRBaseStream";

template <class T> T& objectOf(const CZYRSmartZYRRefPtr<T>& p, int line) {
    if (!p)
        throw CZYRError(ZYRPublic::kZYRErrorInvalidObject, "Null object", kSource, line);
    return *p;
}

} // namespace

// ---- CZYRBaseStream ------------------------------------------------------------------------

CZYRBaseStream::CZYRBaseStream(const CZYRSmartZYRRefPtr<IZYRStream>& stream) : stream_(stream) {}

CZYRBaseStream::CZYRBaseStream(unsigned int mode, unsigned int capacity, void* buffer)
    : stream_(CZYRFileSys::createMemStream(mode, capacity, buffer)) {}

CZYRBaseStream::~CZYRBaseStream() = default;

IZYRStream& CZYRBaseStream::stream() const {
    return objectOf(stream_, __LINE__);
}

void CZYRBaseStream::reOpen(unsigned int mode) {
    stream().reOpen(mode);
}

unsigned int CZYRBaseStream::read(void* buf, unsigned int size, unsigned int count,
                                  ZYRPublic::eZYRErrorType& err) {
    return stream().read(buf, size, count, err);
}

unsigned int CZYRBaseStream::read(void* buf, unsigned int size, unsigned int count) {
    return stream().read(buf, size, count);
}

unsigned int CZYRBaseStream::write(const void* buf, unsigned int size, unsigned int count,
                                   ZYRPublic::eZYRErrorType& err) {
    return stream().write(buf, size, count, err);
}

unsigned int CZYRBaseStream::write(const void* buf, unsigned int size, unsigned int count) {
    return stream().write(buf, size, count);
}

unsigned long long CZYRBaseStream::setPos(const unsigned long long& pos) {
    return stream().setPos(pos);
}

unsigned long long CZYRBaseStream::getPos() {
    return stream().getPos();
}

void CZYRBaseStream::setEOF() {
    stream().setEOF();
}

unsigned long long CZYRBaseStream::getEOF() {
    return stream().getEOF();
}

unsigned long long CZYRBaseStream::getSize() {
    return stream().getSize();
}

unsigned long long CZYRBaseStream::getCapacity() {
    return stream().getCapacity();
}

unsigned int CZYRBaseStream::getAccessMode() {
    return stream().getAccessMode();
}

// ---- CZYRFStream ---------------------------------------------------------------------------

CZYRFStream::CZYRFStream(const CZYRSmartZYRRefPtr<IZYRFStream>& stream)
    : CZYRBaseStream(CZYRSmartZYRRefPtr<IZYRStream>(stream)), fstream_(stream) {}

CZYRFStream::CZYRFStream(const CZYRFileName& name, unsigned int mode)
    : CZYRFStream(CZYRFileSys::createFileStream(name, mode, false)) {}

CZYRFStream::~CZYRFStream() = default;

IZYRFStream& CZYRFStream::fstream() const {
    return objectOf(fstream_, __LINE__);
}

bool CZYRFStream::isOpen() {
    return fstream().isOpen();
}

void CZYRFStream::close() {
    fstream().close();
}

void CZYRFStream::flush() {
    fstream().flush();
}

const CZYRUniString& CZYRFStream::getFilePath() {
    return fstream().getFilePath();
}

// ---- CZYRMemMapFStream ---------------------------------------------------------------------

CZYRMemMapFStream::CZYRMemMapFStream(const CZYRSmartZYRRefPtr<IZYRMemMapFStream>& stream)
    : CZYRFStream(CZYRSmartZYRRefPtr<IZYRFStream>(stream)), mstream_(stream) {}

CZYRMemMapFStream::CZYRMemMapFStream(const CZYRFileName& name, unsigned int mode,
                                     const unsigned long long& offset, unsigned int length)
    : CZYRMemMapFStream(CZYRFileSys::createMemMappedFileStream(name, mode, offset, length)) {}

CZYRMemMapFStream::~CZYRMemMapFStream() = default;

IZYRMemMapFStream& CZYRMemMapFStream::mstream() const {
    return objectOf(mstream_, __LINE__);
}

bool CZYRMemMapFStream::isMapped() {
    return mstream().isMapped();
}

void* CZYRMemMapFStream::getMapAttributes(unsigned long long& offset, unsigned int& length) {
    return mstream().getMapAttributes(offset, length);
}

} // namespace ZYRStd
