#pragma once

// Includes the whole stream core: values, streams, containers.

#include "Containers/ContainerLayout.h"
#include "Containers/ContainerRecognition.h"
#include "Containers/MovieDuration.h"
#include "Containers/RecordingInfo.h"
#include "Containers/RepairPlan.h"
#include "CursorImageSchema.h"
#include "CursorImageWriter.h"
#include "StreamEntries.h"
#include "ZULMMetaDataCommon.h"
#include "ZULMMetaDataParser.h"
#include "ZULMMetaDataReader.h"
#include "ZULMMetaDataUUIDs.h"
#include "ZULMMetaDataWriter.h"
