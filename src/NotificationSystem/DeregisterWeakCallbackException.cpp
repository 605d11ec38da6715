#include "NotificationSystem/DeregisterWeakCallbackException.h"

namespace NotificationSystem
{
VDeregisterWeakCallbackException::~VDeregisterWeakCallbackException() = default;
}
