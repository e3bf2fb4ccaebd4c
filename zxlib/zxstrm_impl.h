// zxstrm_impl.h - what searching and changing strings share.  Not installed.
#ifndef ZXSTRM_IMPL_H
#define ZXSTRM_IMPL_H

#include "zxstrm.h"

namespace zxstrm {

// The program of a pattern that is held in a string, whose text may change at
// any time.  As get_regex() otherwise.
const zxRegex* regex_of(const zxStr& pattern);

// Searches a string, which the subject holder then holds: what is found lies
// in held_subject().
bool search_held(const zxRegex& regex, const zxStr& subject);
const zxStr& held_subject();

}  // namespace zxstrm

#endif  // ZXSTRM_IMPL_H
