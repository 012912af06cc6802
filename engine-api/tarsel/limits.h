/* Fixed capacities of the engine's records. Every record that holds one value
 * per channel or one entry per input is laid out with these; they are part of
 * the binary layout and never change. Usable from C and C++. */
#ifndef TARSEL_LIMITS_H
#define TARSEL_LIMITS_H

/* Channels of one parameter value (a scalar uses 1, a point 2, a colour up to 4). */
#define MAX_CHANNELS 4

/* Image inputs of one effect. */
#define MAX_INPUTS 8

/* Bytes of an effect's name field, terminator included when shorter. */
#define MAX_EFFECT_NAME_LEN 32

/* Bytes of one input-name slot of an effect descriptor. */
#define MAX_INPUT_NAME_LEN 12

/* Per-input fallback values held by an effect descriptor. */
#define MAX_INPUT_DEFAULT_VALUES 20

/* Parameter groups one effect descriptor can hold. */
#define MAX_PARAM_GROUPS 25

/* Effect descriptors one plug-in can carry. */
#define MAX_EFFECTS_PER_PLUGIN 16

/* States (entries) one popup parameter can hold. */
#define MAX_POPUP_STATES 64

#endif /* TARSEL_LIMITS_H */
