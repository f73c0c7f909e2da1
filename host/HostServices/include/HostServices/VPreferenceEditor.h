#pragma once

#include <HostServices/VUndoStack.h>

#include <ZEK/Callback.h>
#include <ZEK/Store.h>

#include <memory>

namespace HostServices
{

/// Changes preferences for a person: at once, checked, and each change a step of the undo stack. Thread: GUI.
class VPreferenceEditor
{
public:
  /// The stack outlives the editor; its steps may outlive the editor and keep the store.
  VPreferenceEditor( std::shared_ptr< ZEK::IStore > i_pStore, VUndoStack& io_rUndo );

  const std::shared_ptr< ZEK::IStore >& Store() const { return m_pStore; }

  /// `OkButNoEffect` for the value that is there, `InvalidValue` or `InvalidType` for one that the entry does not take,
  /// `NotFound` without the entry; then `o_rWhy` says why. A value that is the default counts as the default from then
  /// on. Steps with one merge key in a row are one step, see `VUndoStack`.
  ZEK::IResult Set( ZEK::IStoreReader::Entry i_pEntry, ZEK::VTypedValue i_Value, QString& o_rWhy,
                    const QString& i_rMergeKey = {} );
  /// Back to the default; `NotSet` without one.
  ZEK::IResult Reset( ZEK::IStoreReader::Entry i_pEntry, QString& o_rWhy );

  /// Tells why a step could not be undone or redone, because the entry is no longer what it was.
  ZEK::IMultiCallback< void( QString ) >& Failed() { return *m_pFailed; }

private:
  std::shared_ptr< ZEK::IStore > m_pStore;
  VUndoStack& m_rUndo;
  std::shared_ptr< ZEK::VMultiCallback< void( QString ) > > m_pFailed;
};

} // namespace HostServices
