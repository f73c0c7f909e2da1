#pragma once

#include <ZEK/Callback.h>
#include <ZEK/Result.h>
#include <ZEK/Store.h>

#include <cstddef>
#include <memory>

namespace Store
{

/// An empty store. `i_pService` delivers the callbacks that name no service of their own; without one a store takes
/// only immediate callbacks and those on a given service. The buckets of the path table are as many as
/// `i_BucketCount` for good, so choose about the number of entries to come; 0 counts as 1.
std::shared_ptr< ZEK::IStore > CreateStore( std::shared_ptr< ZEK::IPostalService > i_pService,
                                            std::size_t i_BucketCount );

/// Writes all entries that the reader sees to the same paths of the writer's store: type, values, flags,
/// presentation and extras. With `i_bPersistentOnly` an entry without `EPersistent` is passed over with a line of
/// level 6, and its children are looked at all the same. Entries that the reader does not see are left alone.
/// `InvalidType` when an entry of the target has another type: that entry keeps its values, the others are written.
ZEK::IResult CopyEntries( const ZEK::IStoreReader& i_rFrom, ZEK::IStoreWriter& io_rTo, bool i_bPersistentOnly );

} // namespace Store
