// Kinds of mouse event passed to an effect's on-screen widgets.

%{
#include "tarsel/gfx.h"
%}

enum class MouseEventType {
  MOVE = 0,
  DRAG = 1,
  PRESS = 2,
  RELEASE = 3
};
