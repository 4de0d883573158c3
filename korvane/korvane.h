#pragma once

/// Every public header of the library, floor by floor from the ground.

#include <korvane/platform/AVCaption.h>
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
#include <korvane/platform/KVKeyedCoder.h>
#include <korvane/platform/NSAffineTransform.h>
#include <korvane/platform/NSAttributedString.h>
#include <korvane/platform/NSCoder.h>
#include <korvane/platform/NSColor.h>
#include <korvane/platform/NSError.h>
#include <korvane/platform/NSFont.h>
#include <korvane/platform/NSObject.h>
#include <korvane/platform/NSRange.h>
#include <korvane/platform/NSStringFile.h>
#include <korvane/platform/simd.h>

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
#include <korvane/serialization/KVBinaryXMLField.h>
#include <korvane/serialization/KVBinaryXMLReadStream.h>
#include <korvane/serialization/KVBinaryXMLStreamElement.h>
#include <korvane/serialization/KVBinaryXMLWriteStream.h>
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
#include <korvane/serialization/KVXMLReadStream.h>
#include <korvane/serialization/KVXMLStreamElement.h>
#include <korvane/serialization/KVXMLWriteStream.h>

#include <korvane/time/CMTimeRangeAndNonretainedObject.h>
#include <korvane/time/IntermediateLargeInteger.h>
#include <korvane/time/KVTime.h>
#include <korvane/time/KVTimeCoding.h>
#include <korvane/time/KVTimeRange.h>
#include <korvane/time/VexTimeObj.h>
#include <korvane/time/VexTimePairObj.h>
#include <korvane/time/VexTimeRangeAndObject.h>
#include <korvane/time/VexTimeRangeObj.h>
#include <korvane/time/VexTimeRanges.h>

#include <korvane/cache/KVCache.h>
#include <korvane/cache/KVCacheImpl.h>
#include <korvane/cache/KVCachedFunctionImpl.h>
#include <korvane/cache/KVEvictionHeap.h>

#include <korvane/numerics/KVMatrix33Tmpl.h>
#include <korvane/numerics/KVMatrix44Double.h>
#include <korvane/numerics/KVMatrix44Measure.h>
#include <korvane/numerics/KVMatrix44Parameters.h>
#include <korvane/numerics/KVMatrix44Tmpl.h>
#include <korvane/numerics/KVQuat.h>
#include <korvane/numerics/KVRect.h>
#include <korvane/numerics/KVVector2.h>
#include <korvane/numerics/KVVector3.h>
#include <korvane/numerics/KVVector4.h>

#include <korvane/colour/lut_t.h>
#include <korvane/colour/multilut_t.h>
#include <korvane/colour/tfreader_t.h>
#include <korvane/colour/vec_t.h>

#include <korvane/compositing/KVBlend.h>
#include <korvane/compositing/KVFxBlendOptions.h>
#include <korvane/compositing/KVFxLightWrapOptions.h>

#include <korvane/captions/KVCaption.h>
#include <korvane/captions/KVCaptionCEA608.h>
#include <korvane/captions/KVCaptionGroups.h>
#include <korvane/captions/KVCaptionSRT.h>
#include <korvane/captions/KVCaptionText.h>
#include <korvane/captions/KVCaptioniTT.h>
#include <korvane/captions/KVMutableCaption.h>
#include <korvane/captions/KVSRTCaptionsExporter.h>
#include <korvane/captions/KVSRTCaptionsImporter.h>

#include <korvane/media/KVAtomBox.h>
#include <korvane/media/KVAtomBoxFile.h>
#include <korvane/media/KVAtomMetadataHandler.h>
#include <korvane/media/KVImageDescAtomBox.h>
#include <korvane/media/KVXMPStringParser.h>
