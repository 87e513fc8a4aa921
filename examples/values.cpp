// Values: a dictionary and an array built, finalized, shared between threads, printed.
//
// Shows: building a job's page settings as a dictionary holding an array, finalizing it so
// that it no longer changes, reading it from four threads at once (a finalized container
// needs no lock), a change refused after finalizing, and the dictionary printed.
#include <cstdio>
#include <sstream>
#include <thread>
#include <vector>

#include <ZYRHostKit.h>
#include <ZYRStd.h>

using namespace ZYRStd;

int main() {
    tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    InitCommonUniStrings();
    InitDynamicUniStringCache();
    int status = 0;
    {
        CZYRArray mediaBox;
        for (unsigned int i = 0; i < 4; ++i)
            mediaBox.set(i, i < 2 ? 0.0 : (i == 2 ? 595.0 : 842.0));
        CZYRDict page;
        page.set(CZYRUniString("MediaBox"), mediaBox);
        page.set(CZYRUniString("Copies"), 2u);
        page.set(CZYRUniString("Duplex"), true);
        page.set(CZYRUniString("Title"), CZYRUniString("Menu card"));
        page.finalize(); // the nested array is finalized with it

        // Each renderer thread reads the same dictionary; no lock is needed.
        std::vector<double> widths(4);
        std::vector<std::thread> renderers;
        for (unsigned int t = 0; t < widths.size(); ++t)
            renderers.emplace_back([&page, &widths, t] {
                CZYRArray box;
                double right = 0, left = 0;
                if (page.get(CZYRUniString("MediaBox"), box) && box.get(2, &right) &&
                    box.get(0, &left))
                    widths[t] = right - left;
            });
        for (std::thread& renderer : renderers)
            renderer.join();
        for (double width : widths)
            status |= width == 595.0 ? 0 : 1;
        std::printf("four threads read the page width: %.0f\n", widths[0]);

        try {
            page.set(CZYRUniString("Copies"), 3u);
            status = 1;
        } catch (const CZYRError& e) {
            std::printf("a finalized dictionary refuses changes: %s\n", e.getMessage());
        }

        std::ostringstream text;
        ZYRDictEnumProcs printer(text, 2, 0);
        C_Error err;
        page.getImpl()->enumerate(&printer, err);
        std::printf("the page settings:\n%s", text.str().c_str());
    }
    ReleaseDynamicUniStringCache();
    ReleaseCommonUniStrings();
    return status;
}
