// The reference engine's own declarations. What it makes of the values the
// contract leaves to the engine (its catalogues, parameter defaults and text
// forms, rendering, frame requests, widgets, shared memory) is described in
// docs/reference-engine.md.
#pragma once

#define TARSEL_REFERENCE_VERSION "0.1.0"
