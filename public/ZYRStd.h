// The whole exported interface of ZYRStd in one include.
#pragma once

#include "C_SmartPtr.h"
#include "I_Error.h"
#include "ZYRStdExport.h"
#include "eFlushMemorySeverity.h"
#include "eZYRErrorType.h"
#include "sZYRTraceMsg.h"

#include "zyr/std/CZYRClientBase.h"
#include "zyr/std/CZYRClientRegistry.h"
#include "zyr/std/CZYRError.h"
#include "zyr/std/CZYRHash.h"
#include "zyr/std/CZYRSmartPtr.h"
#include "zyr/std/CZYRStdAllocator.h"
#include "zyr/std/IStackWalker.h"
#include "zyr/std/I_FlushableMemoryClient.h"
#include "zyr/std/ZYRDMM.h"
#include "zyr/std/ZYRMem.h"
#include "zyr/std/ZYRStdInit.h"
#include "zyr/std/ZYRThread.h"
#include "zyr/std/ZYRVirtualMem.h"
