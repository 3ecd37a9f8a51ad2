#include "sign/signing.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <string>
#include <vector>

#include "sign/integrity.h"
#include "util/digest.h"
#include "util/log.h"

namespace {

uint32_t VeltSignOat(ApkTools::Apk& apk, int fd);
