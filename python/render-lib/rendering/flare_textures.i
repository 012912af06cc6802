// The engine's store of flare textures: images that lens-flare elements draw
// with, loaded from files or copied from caller pixels, addressed by index.
// These calls keep the interpreter lock.

%{
#include "tarsel/effect.h"
%}

%include "typemaps.i"

int tarsel_load_flare_texture(char const *path);
const char *tarsel_get_flare_texture_error();
int tarsel_register_flare_texture(int xsize, int ysize, int n_channels, int bytes_per_channel, RawImage pixels);

// [result, xsize, ysize, n_channels, bytes_per_channel, n_bytes]
%apply int *ZeroedOutput { int *xsize, int *ysize, int *n_channels, int *bytes_per_channel };
%apply size_t *ByteCount32 { size_t *n_bytes };
int tarsel_get_texture_info(int index, int *xsize, int *ysize, int *n_channels, int *bytes_per_channel,
                            size_t *n_bytes);
%clear int *xsize, int *ysize, int *n_channels, int *bytes_per_channel;
%clear size_t *n_bytes;

// The engine copies the texture into `dest`, which is not checked for
// writability.
%apply (void *BufferAddress, size_t BufferSize) { (void *dest, size_t dest_size) };
int tarsel_get_texture_pixels(int index, void *dest, size_t dest_size);
%clear (void *dest, size_t dest_size);

void tarsel_free_all_flare_textures();
