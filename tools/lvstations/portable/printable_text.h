// Text from the store as a terminal may print it: nothing in it can end a line, move the cursor
// or start a terminal sequence.
#pragma once

#include "support/portable/wide_text.h"

// The text with each character that a terminal would act on written as an escape: "\x1B" for
// the C0 controls (CR, LF and ESC among them), DEL and the C1 controls; "\u2028" for the line
// and paragraph separators, the bidirectional formatting characters (which reorder what follows
// on the screen) and unpaired surrogates; "\\" for the backslash itself, so that every escape
// reads back to exactly one character. Anything else is kept as it is.
WideString PrintableText(WideStringView text);
