// Compiled such that it holds all inline functions of these headers, so that those are counted too that only
// a caller of the library calls.
#include "basic/exceptions/exceptions.h"
#include "processes/gridmill/changeparams.h"
#include "processes/gridmill/gridmill.h"

namespace orvik::changedetection::details {

template class ChangeParams<DiffType>;
template class ChangeParams<DiffType2>;

}  // namespace orvik::changedetection::details
