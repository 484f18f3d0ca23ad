// The container instantiations compiled into the library.
#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>
#include <krCoreLib/objectmodel/CKRObjPtrList.h>

template class CKRObjPtrList<IKRObject>;
template class CKRObjGuidPtrMap<IKRObject>;
