#pragma once

#include "SaveSteps.h"

namespace UtilsFileSystem
{

struct VSaveLock::VState
{
  Platform::VLockFile Lock;
};

/// Takes the lock for a save, without waiting, and says why that could not be.
ZEK::IResult TakeSaveLock( const VSaveNames& i_rNames, Platform::VLockFile& io_rLock );

} // namespace UtilsFileSystem
