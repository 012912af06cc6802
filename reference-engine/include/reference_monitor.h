// What the reference QRVExternalMonitor library makes of the values the
// display contract (engine-api/qrv/external_monitor.h) leaves to the library.
// Host authors read this beside the contract.
#pragma once

// Displays (EM_DisplayInit, delete)
//   Every EM_DisplayInit call makes a new display with its own set of virtual
//   devices: two displays never share a connection or a frame. Deleting a
//   display disconnects its devices.
//
// Devices and modes (devices, device_modes)
//   | Device    | What it does with a frame                                   | Modes                                              |
//   |-----------|-------------------------------------------------------------|----------------------------------------------------|
//   | "preview" | keeps the last frame shown in memory (its pixels, its size  | "1920x1080p25", "1920x1080p50", "1280x720p50",     |
//   |           | and the number of frames shown since connect)               | "1280x720p25", "640x360p25"                        |
//   | "folder"  | writes each frame as an 8-bit RGBA PNG file                 | "1920x1080p25", "1280x720p25", "640x360p25",       |
//   |           | "frame-NNNNNN.png" (NNNNNN counting from 000000 at connect) | "320x180p25"                                       |
//   A mode name reads <width>x<height>p<frames per second>. The name arrays
//   belong to the display and stay valid until it is deleted.
//   The folder device writes into the folder named by the library's own
//   setting, the environment variable QRV_MONITOR_FOLDER, read at connect
//   (default: "qrv-monitor" in $TMPDIR, or in /tmp); set_output_option(
//   "folder", "folder", path) overrides it for that display. connect makes the
//   folder (and its parents) if needed; existing files of the same names are
//   replaced.
//
// Status values (connect, display_frame)
//   EM_errorNone       done (disconnecting a device that is not connected too)
//   EM_errorParam      a null device text or image, an image this library did
//                      not make or that is gone, an image whose size is not
//                      the connected mode's size
//   EM_errorNotFound   no device or mode of that name
//   EM_errorDevice     display_frame on a device that is not connected; the
//                      folder device cannot make its folder or write a file
//   get_width and get_height give the connected mode's size, 0 for a device
//   that is unknown or not connected.
//   The slots the binding does not call: set_output_option (only "folder" of
//   the folder device; anything else EM_errorParam), get_status (EM_errorNone
//   when connected, EM_errorDevice when not, EM_errorNotFound for no such
//   device), flush_output (EM_errorNone; frames are out when display_frame
//   returns), get_refresh_rate (the mode's frames per second, 0 when not
//   connected).
//
// Images (EM_XIImageWrapper), the eleven values in order
//   pixels         address of the first byte of the first stored row; read,
//                  never written, and only during display_frame (the image
//                  keeps the address, not a copy)
//   width, height  size in pixels, each 1 or more
//   row_bytes      distance in bytes from one stored row to the next, at
//                  least width * 4
//   name           a label shown with the frame: the preview device keeps it,
//                  the folder device writes it as the PNG text "Title"; null
//                  or "" for none. Copied when the image is made.
//   flip_y         true: rows are stored bottom-up (the first stored row is
//                  the bottom of the picture)
//   format         EM_ImageFormat_32BitIntBGRA (bytes B, G, R, A) or
//                  EM_ImageFormat_32BitIntARGB (bytes A, R, G, B)
//   pixel_aspect   width of a pixel over its height, above 0; the folder
//                  device writes it as the PNG physical pixel size
//   gamma          the encoding gamma of the values (2.2 for common video);
//                  0 for unknown; written as the PNG gamma when above 0.
//                  Pixel values are not changed by it.
//   premultiplied  true: colour channels are premultiplied by alpha; devices
//                  show straight colour, so each is divided by alpha
//                  (rounded, at most 255; 0 where alpha is 0)
//   full_range     true: values span 0..255; false: video range, colour
//                  16..235 is expanded to 0..255 (clamped) before the alpha
//                  division. Alpha is always full range.
//   Anything else (null pixels, a size below 1, too short a row, another
//   format, an aspect that is not above 0 or a gamma below 0, either not
//   finite) makes no image: the result is null.
//   Devices receive each frame converted to B, G, R, A bytes, top row first,
//   straight colour, full range: the preview device keeps exactly those.
//   An image starts with one reference (the caller's); removeRef returns the
//   count left and frees the image when it reaches 0. display_frame takes no
//   reference of its own.
