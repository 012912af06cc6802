// Engine-wide controls of effect instances.

%{
#include "tarsel/effect.h"
%}

// An abort request ends the render in progress (and any render started before
// the request is cleared) with RuntimeError "Tarsel Abort". Both keep the
// interpreter lock, which is free while another thread renders.
void tarsel_abort_render();
void tarsel_clear_abort();
