#include <gtest/gtest.h>

#include <string>

#include "I_OEMInterfaceSet.h"
#include "TestSupport.h"
#include "ZYRHostKit.h"
#include "zyr/std/core/CZYRError.h"

using namespace ZYRHostKit;

TEST(HostKitTest, FileNameSplitsAtTheLastSlash) {
    const CPosixFileName nested(u"/data/in/a.pdf"), plain(u"a.pdf");
    EXPECT_EQ(std::u16string(nested.getFileName().c_str()), u"a.pdf");
    EXPECT_EQ(std::u16string(nested.getFileDirPath().c_str()), u"/data/in");
    EXPECT_EQ(std::u16string(plain.getFileName().c_str()), u"a.pdf");
    EXPECT_TRUE(plain.getFileDirPath().empty());
}

TEST(HostKitTest, JobOffersNoRasterInterface) {
    const auto job = makeHostJob(7, nullptr);
    ZYRStd::C_Error err;
    const ZYRPublic::C_SmartPtr<ZYRPublic::I_OEMInterfaceSet> set(job->getOEMInterfaces(err),
                                                                  false);
    ZYRPublic::I_OEMRasterInterface* raster = nullptr;
    EXPECT_FALSE(set->getOEMRasterInterface(&raster, err) || raster || err.errorOccurred());
}

TEST(HostKitTest, SessionEndUnsetsTheFactory) {
    {
        const HostSession session;
        EXPECT_NE(ZYRStd::ZYRGetFactory(), nullptr);
    }
    EXPECT_TRUE(zyrtest::startsWith(zyrtest::thrown([] { ZYRStd::ZYRGetFactory(); }),
                                    std::to_string(ZYRPublic::kZYRErrorFatal) +
                                        ": ZYRFactory Proc not set in ZYRStd"));
}
