#pragma once

/// Every public header of the library, floor by floor from the ground.

#include <korvane/platform/CFArray.h>
#include <korvane/platform/CFBase.h>
#include <korvane/platform/CFBundle.h>
#include <korvane/platform/CFData.h>
#include <korvane/platform/CFDictionary.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/platform/CFString.h>
#include <korvane/platform/CFURL.h>
#include <korvane/platform/CMTime.h>
#include <korvane/platform/NSObject.h>
#include <korvane/platform/NSRange.h>

#include <korvane/foundation/KVArray.h>
#include <korvane/foundation/KVCFRef.h>
#include <korvane/foundation/KVDynamicArray.h>
#include <korvane/foundation/KVException.h>
#include <korvane/foundation/KVExport.h>
#include <korvane/foundation/KVInfo.h>
#include <korvane/foundation/KVMutex.h>
#include <korvane/foundation/KVNSRef.h>
#include <korvane/foundation/KVPrint.h>
#include <korvane/foundation/KVShared.h>
#include <korvane/foundation/KVSharedMutex.h>
#include <korvane/foundation/KVSingleton.h>
#include <korvane/foundation/KVSpinLock.h>
#include <korvane/foundation/KVStackTrace.h>
#include <korvane/foundation/KVString.h>
#include <korvane/foundation/KVThread.h>
#include <korvane/foundation/KVURL.h>
#include <korvane/foundation/KVUUID.h>
#include <korvane/foundation/KVVersion.h>

#include <korvane/media/KVAtomBox.h>
#include <korvane/media/KVAtomBoxFile.h>
#include <korvane/media/KVAtomMetadataHandler.h>
#include <korvane/media/KVImageDescAtomBox.h>
#include <korvane/media/KVXMPStringParser.h>
