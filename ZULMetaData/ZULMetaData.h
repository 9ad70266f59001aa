#pragma once

// Everything of the stream core: values, streams, containers.

#include "ZULMetaData/ContainerLayout.h"
#include "ZULMetaData/CursorImageSchema.h"
#include "ZULMetaData/CursorImageWriter.h"
#include "ZULMetaData/RecordingInfo.h"
#include "ZULMetaData/ZULMMetaDataCommon.h"
#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaData/ZULMMetaDataReader.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
