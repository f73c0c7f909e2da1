#pragma once

#include <ZEK/EntryPath.h>
#include <ZEK/Export.h>
#include <ZEK/Result.h>
#include <ZEK/Serialiser.h>
#include <ZEK/Store.h>

#include <stdexcept>
#include <string>

namespace ZEK
{

/// A typed read that failed; the text is that of the log line it would have been.
class ZEK_API VStoreException : public std::runtime_error
{
public:
  VStoreException( IResult i_Result, const std::string& i_rText );
  ~VStoreException() override;

  IResult m_Result;
};

namespace StoreDetail
{
/// Why the verified value of the entry did not read as `i_pWanted`; writes the line unless `o_pText` takes the text.
ZEK_API IResult ReadFailed( const IStoreReader& i_rReader, IStoreReader::Entry i_pEntry, const IO::ISchema* i_pWanted,
                            std::string* o_pText = nullptr );
/// The entry of a path, null with the reason when there is none.
ZEK_API IStoreReader::Entry FindForRead( const IStoreReader& i_rReader, const VEntryPath& i_rPath, IResult& o_rResult );
} // namespace StoreDetail

/// Reads the verified value of an entry. `NotFound` when the entry is not there, `NotSet` when it has no value,
/// `InvalidType` when its value is not a `T` (nothing is converted), `Failed` when the bytes are damaged; each with
/// a line in the log category "Store". After a failure `o_rValue` is as it was.
template < typename T >
IResult ReadValue( const IStoreReader& i_rReader, ::Store::VStoreEntry* i_pEntry, T& o_rValue )
{
  // An entry that is not there reads as empty, so that the usual case asks only once.
  if ( IO::ReadTyped( i_rReader.VerifiedValue( i_pEntry ), o_rValue ) )
  {
    return IResult::Ok;
  }
  return StoreDetail::ReadFailed( i_rReader, i_pEntry, IO::VSerialiser< T >::Schema() );
}

/// As above by path, without making a handle; `InvalidArgument` for a path with `*`.
template < typename T >
IResult ReadValue( const IStoreReader& i_rReader, const VEntryPath& i_rPath, T& o_rValue )
{
  IResult Result;
  const IStoreReader::Entry pEntry = StoreDetail::FindForRead( i_rReader, i_rPath, Result );
  return pEntry != nullptr ? ReadValue( i_rReader, pEntry, o_rValue ) : Result;
}

/// Reads the verified value of an entry, or throws `VStoreException` with the result and text of `ReadValue`;
/// writes no line.
template < typename T >
T GetValue( const IStoreReader& i_rReader, ::Store::VStoreEntry* i_pEntry )
{
  T Value{};
  if ( !IO::ReadTyped( i_rReader.VerifiedValue( i_pEntry ), Value ) )
  {
    std::string Text;
    const IResult Result = StoreDetail::ReadFailed( i_rReader, i_pEntry, IO::VSerialiser< T >::Schema(), &Text );
    throw VStoreException( Result, Text );
  }
  return Value;
}

} // namespace ZEK
