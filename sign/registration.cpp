#include "sign/registration.h"
