#pragma once

// Everything of the stream core: values, streams, containers.

#include "ZULMetaData/ContainerLayout.h"
#include "ZULMetaData/ContainerRecognition.h"
#include "ZULMetaData/CursorImageSchema.h"
#include "ZULMetaData/CursorImageWriter.h"
#include "ZULMetaData/MovieDuration.h"
#include "ZULMetaData/RecordingInfo.h"
#include "ZULMetaData/RepairPlan.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaData/StreamExtent.h"
#include "ZULMetaData/ZULMMetaDataCommon.h"
#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaData/ZULMMetaDataReader.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
