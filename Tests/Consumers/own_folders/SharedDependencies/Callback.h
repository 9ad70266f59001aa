#pragma once

// A header of an application whose path is also that of a header of the library.
#define APPLICATION_HAS_CALLBACK
