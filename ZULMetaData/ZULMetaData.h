#pragma once

// Includes the whole stream core: values, streams, containers.

#include "ContainerLayout.h"
#include "ContainerRecognition.h"
#include "CursorImageSchema.h"
#include "CursorImageWriter.h"
#include "MovieDuration.h"
#include "RecordingInfo.h"
#include "RepairPlan.h"
#include "StreamEntries.h"
#include "StreamExtent.h"
#include "ZULMMetaDataCommon.h"
#include "ZULMMetaDataParser.h"
#include "ZULMMetaDataReader.h"
#include "ZULMMetaDataUUIDs.h"
#include "ZULMMetaDataWriter.h"
