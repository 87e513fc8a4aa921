/// \file
/// Where the engine's resources live: the fonts, font cache, ICC profile and temporary
/// directories, the font cache list names and the font directory list.
#pragma once

#include <cstdint>
#include <string>

#include "C_SmartPtr.h"
#include "I_Dict.h"
#include "ZYRStdExport.h"

namespace ZYRStd {

class CZYRDict;
class CZYRUniString;

/// The texts are copied; a null or empty text means "not set".
///@{
ZYRSTD_API void ZYRSetZYRFontsDir(const char16_t* dir);
ZYRSTD_API void ZYRSetFontCacheDir(const char16_t* dir);
///@}
/// The pointer itself is kept: the caller keeps the text alive.
ZYRSTD_API void ZYRSetIccProfileDir(const char16_t* dir);
/// Stores the temporary directory as narrow text (UniStringToString).
ZYRSTD_API void ZYRSetTempDirectory(const CZYRUniString& dir);

/// True once a font cache directory is set.
ZYRSTD_API bool ZYRFontCacheDirExist();
/// Empty until set.
ZYRSTD_API CZYRUniString ZYRGetFontCacheDir();
/// Invalid until set.
ZYRSTD_API CZYRUniString ZYRGetIccProfileDir();
/// A copy of the temporary directory; empty until set.
ZYRSTD_API std::string ZYRGetTempDirectory();

/// The font cache directory followed by "/OrmunFnt14_sys.lst", "/OrmunFnt14_com.lst" and
/// "/OrmunFnt14_Cmap.lst".
///@{
ZYRSTD_API CZYRUniString ZYRGetSystemCacheFile();
ZYRSTD_API CZYRUniString ZYRGetCommonCacheFile();
ZYRSTD_API CZYRUniString ZYRGetCmapCacheFile();
///@}

/// The font directories to search: the three resource directories (under the fonts
/// directory when one is set, else relative), then each entry of the "ReferenceFontDir"
/// array of `options` (a path or file URL; a null entry for one that is not a string).
/// `dirList` gets a new array of n + 3 slots whose first entries are filled; `count` grows
/// by the number filled. `dirList` is null when the array cannot be allocated. With a font
/// cache directory, `cacheFile` gets a fresh list name, ".../OrmunFnt14_VELT_<n>.lst" with
/// n = 1001, 1002, ... from call to call; without one it is left alone. Every block comes
/// from ZYRMalloc and is the caller's to ZYRFree. A failure throws CZYRError and hands
/// nothing out.
ZYRSTD_API void ZYRSetDirListAndCacheFileList(const CZYRDict& options, unsigned short**& dirList,
                                              unsigned short*& cacheFile, unsigned int& count);

/// The same for the interface dictionary, across the module boundary, so it never throws.
/// Returns the number of entries filled in `dirList` (which gets n + 3 slots as above, or
/// null when they cannot be allocated), or -1 on failure, when nothing is handed out. With a
/// font cache directory, `cacheFiles` gets a null-terminated array of four names: the fresh
/// ".../OrmunFnt14_VELT_<n>.lst" of the other form, then the system, common and CMap list
/// files; without one it is left alone. The caller frees each name and both arrays with
/// ZYRFree.
ZYRSTD_API int32_t ZYRSetDirListAndCacheFileList(ZYRPublic::C_SmartPtr<ZYRPublic::I_Dict> options,
                                                 unsigned short**& dirList,
                                                 unsigned short**& cacheFiles);

} // namespace ZYRStd
