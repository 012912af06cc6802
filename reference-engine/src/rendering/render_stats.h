// What the test probe reads about renders and sets for them.
#pragma once

namespace tarsel_ref {

// Wall time of the last render call, measured inside the entry point.
void note_render_seconds(double seconds);
double last_render_seconds();

// While set, the render entry points check their basic arguments and return
// success without rendering (for measuring what a call costs on its way in).
void set_render_immediate_return(bool on);
bool render_immediate_return();

}  // namespace tarsel_ref
