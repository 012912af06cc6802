// Out-of-line members of the contract's classes, so their type information and
// virtual tables are emitted once, here, and exported.
#include "tarsel/errors.h"
#include "tarsel/render_context.h"

TarselAbortException::~TarselAbortException() = default;

const char *TarselAbortException::what() const { return "Tarsel Abort"; }

RenderContext::RenderContext() = default;

RenderContext::~RenderContext() = default;
