// Companion distribution library stand-in: the qdr_ functions the tolerance models call.
#ifndef KELSTAT_PLATFORM_QDR_H
#define KELSTAT_PLATFORM_QDR_H

#endif  // KELSTAT_PLATFORM_QDR_H
