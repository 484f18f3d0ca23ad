#include <krCoreLib/platform/KRWindowTypes.h>

CKRWnd::~CKRWnd() = default;
