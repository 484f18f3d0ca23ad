// The multi-word integers: the instantiations compiled into the library.
#include <krCoreLib/geometry/KRTInteger.h>

namespace krRationalArithmetic {

template class TInteger<2>;
template class TInteger<4>;
template class TInteger<16>;
template class TInteger<32>;

}  // namespace krRationalArithmetic
