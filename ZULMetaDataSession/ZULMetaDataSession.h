#pragma once

// Includes everything with which recorders and editors are written.

#include "EditList.h"
#include "Error.h"
#include "Insights/Camera.h"
#include "Insights/Chapters.h"
#include "Insights/Clicks.h"
#include "Insights/CursorPath.h"
#include "Insights/Idle.h"
#include "Insights/Insights.h"
#include "Insights/KeyCaptions.h"
#include "Insights/Zooms.h"
#include "Rational.h"
#include "Recording.h"
#include "Track.h"
#include "TrackValues.h"
