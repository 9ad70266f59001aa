#pragma once

// Includes everything with which recorders and editors are written.

#include "EditList.h"
#include "Error.h"
#include "Insights/Chapters.h"
#include "Insights/Clicks.h"
#include "Insights/Idle.h"
#include "Insights/KeyCaptions.h"
#include "Picture.h"
#include "Rational.h"
#include "Recording.h"
#include "RecordingStates.h"
#include "Retiming.h"
#include "Retiming/ButtonHistory.h"
#include "Retiming/CursorEntries.h"
#include "Retiming/EntryIndex.h"
#include "Retiming/PieceClock.h"
#include "Snapshot.h"
#include "TimeIndex.h"
#include "Timeline.h"
#include "Track.h"
#include "TrackValues.h"
