// Streams: a file read through the ASCII85 decoder, with a bad byte reported.
//
// Shows: a file stream opened through the installed file system, a decoding filter stacked
// on it, the decoded text read in chunks, and the decoder's report of the first byte that
// is not ASCII85: which byte and at which offset of the input.
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>
#include <unistd.h>

#include <ZYRHostKit.h>
#include <ZYRStd.h>

using namespace ZYRStd;

// Decodes the file and prints what came out, then why it stopped.
int decode(const std::string& path) {
    CZYRSmartZYRRefPtr<ZYRStreams::IZYRStream> file(CZYRFileSys::createFileStream(
        CZYRFileName(path.c_str()), ZYRStreams::kZYRStreamRead, false));
    CZYRStreamFilterASCII85Decode decoder(file);
    std::string text;
    char chunk[16];
    try {
        while (unsigned int got = decoder.read(chunk, 1, sizeof chunk))
            text.append(chunk, got);
        std::printf("decoded: \"%s\"\n", text.c_str());
        return 0;
    } catch (const CZYRError& e) {
        std::printf("decoded so far: \"%s\"\nstopped: %s (byte 0x%02X at offset %llu)\n",
                    text.c_str(), e.getMessage(), decoder.getFailureCharacter(),
                    decoder.getFailureOffset());
        return 1;
    }
}

int main() {
    tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    const char* tmp = std::getenv("TMPDIR");
    std::string path = std::string(tmp && *tmp ? tmp : "/tmp") + "/zyrstd-example-XXXXXX";
    const int fd = ::mkstemp(path.data());
    if (fd < 0)
        return 1;
    ::close(fd);
    int status;
    {
        ZYRHostKit::HostSession session;
        // "Hello, world" in ASCII85, then the same with a 'v' (not ASCII85) in the middle.
        std::ofstream(path) << "87cURD_*#TDfTZ)~>";
        status = decode(path);
        std::ofstream(path) << "87cURD_*#vTDfTZ)~>";
        status |= decode(path) == 1 ? 0 : 1;
    }
    std::remove(path.c_str());
    return status;
}
