#pragma once

// Includes everything with which recorders and editors are written.

#include "AbandonedSession.h"
#include "EditList.h"
#include "Error.h"
#include "Insights/Chapters.h"
#include "Insights/Clicks.h"
#include "Insights/Idle.h"
#include "Insights/KeyCaptions.h"
#include "Picture.h"
#include "Rational.h"
#include "Recording.h"
#include "RecordingClock.h"
#include "SessionWriter.h"
#include "Snapshot.h"
#include "Timeline.h"
#include "Track.h"
#include "TrackValues.h"
