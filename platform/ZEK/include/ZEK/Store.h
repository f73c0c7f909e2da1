#pragma once

#include <ZEK/EntryPath.h>
#include <ZEK/Export.h>
#include <ZEK/HandlerCallback.h>
#include <ZEK/Result.h>
#include <ZEK/StoreReader.h>
#include <ZEK/StoreWriter.h>

#include <cstddef>
#include <memory>

namespace ZEK
{

/// Keeps one copy of each path for good.
class IRegistry
{
public:
  virtual ~IRegistry() = default;
  /// The kept copy, made on first use.
  virtual const VEntryPath& GetEntryPath( const VEntryPath& i_rPath ) = 0;
};

/// A tree of named, typed settings, read and written in scopes.
///
/// Handles are made on first use, stay valid as long as the store, and say nothing about whether the entry is
/// there. Readers of one time see one generation of all entries; a write scope ends when they have left, and its
/// writes are then there together. Scopes of one thread nest: inside a write scope a read scope gives the
/// writer, inside a read scope there is no write scope. Thread: any. A thread that waits, in a read scope, for
/// another thread's write scope to end waits for ever. No scope may be open or ending when a store is destroyed.
class IStore : public IRegistry
{
public:
  /// Later commits apply, and are told to nobody. `NotPermitted` inside a read scope.
  virtual IResult Shutdown() = 0;
  virtual ::Store::VStoreEntry* GetRootEntry() = 0;
  /// Finds the handle or makes it; an entry is not made by it. A `*` in the path is a name here.
  virtual ::Store::VStoreEntry* GetEntry( const VEntryPath& i_rPath ) = 0;
  virtual const VEntryPath& EntryPath( const ::Store::VStoreEntry* i_pEntry ) const = 0;

  /// Never null.
  virtual IStoreReader* BeginRead() = 0;
  /// Ends a scope of BeginRead; on the outermost one deferred functions run, and what they throw comes out.
  virtual void EndRead() = 0;
  /// Null inside a read scope: then nothing is to be ended.
  virtual IStoreWriter* BeginWrite() = 0;
  /// Ends a scope of BeginWrite; the outermost one commits, calls the immediate callbacks and posts the others.
  /// When callbacks throw, the rest is done all the same, and the first exception comes out.
  virtual void EndWrite() = 0;

  /// The handler of the set, the same one for equal sets while it lives. Hears entries that come later, too.
  virtual std::shared_ptr< IHandlerCallback > RegisterHandler( const VEntryPatternSet& i_rSet ) = 0;
  /// The number of sets that have a handler.
  virtual std::size_t HandlerCount() const = 0;

  /// The handle of the path if there is one, else null; makes nothing and takes no lock. A `*` is a name here.
  virtual ::Store::VStoreEntry* FindEntry( const VEntryPath& i_rPath ) const = 0;
};

/// A read scope as long as the object lives. Thread: the one that made it. As its destructor may throw, it stands on
/// its own in a block, never in a container or `std::optional`.
class VStoreReadScope
{
public:
  explicit VStoreReadScope( IStore& io_rStore )
    : m_rStore( io_rStore )
    , m_pReader( io_rStore.BeginRead() )
  {
  }
  VStoreReadScope( const VStoreReadScope& ) = delete;
  VStoreReadScope& operator=( const VStoreReadScope& ) = delete;
  /// What a deferred function throws comes out, or goes to the log when another exception is on its way.
  ~VStoreReadScope() noexcept( false );

  IStoreReader* operator->() const { return m_pReader; }
  IStoreReader& operator*() const { return *m_pReader; }

private:
  IStore& m_rStore;
  IStoreReader* m_pReader;
};

/// A write scope as long as the object lives; empty inside a read scope. Otherwise as the read scope.
class VStoreWriteScope
{
public:
  explicit VStoreWriteScope( IStore& io_rStore )
    : m_rStore( io_rStore )
    , m_pWriter( io_rStore.BeginWrite() )
  {
  }
  VStoreWriteScope( const VStoreWriteScope& ) = delete;
  VStoreWriteScope& operator=( const VStoreWriteScope& ) = delete;
  /// Commits. What a callback throws comes out, or goes to the log when another exception is on its way.
  ~VStoreWriteScope() noexcept( false );

  explicit operator bool() const { return m_pWriter != nullptr; }
  IStoreWriter* operator->() const { return m_pWriter; }
  IStoreWriter& operator*() const { return *m_pWriter; }

private:
  IStore& m_rStore;
  IStoreWriter* m_pWriter;
};

namespace StoreDetail
{
/// To be called while an exception is handled: throws it on, or writes it to the log when another one is on its way.
ZEK_API void ScopeFailed();
} // namespace StoreDetail

inline VStoreReadScope::~VStoreReadScope() noexcept( false )
{
  try
  {
    m_rStore.EndRead();
  }
  catch ( ... )
  {
    StoreDetail::ScopeFailed();
  }
}

inline VStoreWriteScope::~VStoreWriteScope() noexcept( false )
{
  if ( m_pWriter == nullptr )
  {
    return;
  }
  try
  {
    m_rStore.EndWrite();
  }
  catch ( ... )
  {
    StoreDetail::ScopeFailed();
  }
}

} // namespace ZEK
