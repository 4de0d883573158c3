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
#include <korvane/platform/CMTimeRange.h>
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

#include <korvane/serialization/KVAsciiStream.h>
#include <korvane/serialization/KVBufferReadStream.h>
#include <korvane/serialization/KVBufferWriteStream.h>
#include <korvane/serialization/KVByteWriteStream.h>
#include <korvane/serialization/KVFileReadStream.h>
#include <korvane/serialization/KVFileWriteStream.h>
#include <korvane/serialization/KVHash128.h>
#include <korvane/serialization/KVHashWriteStream.h>
#include <korvane/serialization/KVIgnoreElement.h>
#include <korvane/serialization/KVMD5.h>
#include <korvane/serialization/KVScope.h>
#include <korvane/serialization/KVSerializer.h>
#include <korvane/serialization/KVSerializerReadStream.h>
#include <korvane/serialization/KVSerializerWriteStream.h>
#include <korvane/serialization/KVStream.h>
#include <korvane/serialization/KVStreamElement.h>
#include <korvane/serialization/KVXMLWriteStream.h>
#include <korvane/platform/KVKeyedCoder.h>
#include <korvane/platform/NSCoder.h>
#include <korvane/platform/NSError.h>
#include <korvane/cache/KVCache.h>
#include <korvane/cache/KVCacheImpl.h>
#include <korvane/cache/KVCachedFunctionImpl.h>
#include <korvane/cache/KVEvictionHeap.h>

#include <korvane/time/IntermediateLargeInteger.h>
#include <korvane/time/KVTime.h>
#include <korvane/time/KVTimeRange.h>

#include <korvane/colour/lut_t.h>
#include <korvane/colour/multilut_t.h>
#include <korvane/colour/tfreader_t.h>
#include <korvane/colour/vec_t.h>
