#include "StoreLog.h"
#include "StoreWriter.h"
#include "VStore.h"

#include <ZEK/DebugServices.h>

#include <utility>

// Values, types and flags, and entries as a whole.

namespace Store
{

using namespace ZEK;

namespace
{
bool Fits( const VStoreEntry& i_rEntry, const IO::ISchema* i_pSchema )
{
  if ( i_pSchema->m_Type == IO::EType::Void )
  {
    return true;
  }
  const VEntryChange* const pChange = i_rEntry.m_pChange;
  if ( pChange != nullptr && pChange->m_pSchema != nullptr )
  {
    return pChange->m_pSchema == i_pSchema;
  }
  return i_rEntry.m_pSchema == nullptr || i_rEntry.m_pSchema == i_pSchema || IsReplaced( i_rEntry );
}

void SetVerified( VEntryChange& io_rChange, VTypedValue&& i_rValue )
{
  io_rChange.m_Values.m_Verified = std::move( i_rValue );
  io_rChange.m_Mask |= EChangeVerified;
}

void SetProposed( VEntryChange& io_rChange, VTypedValue&& i_rValue )
{
  io_rChange.m_Values.m_Proposed = std::move( i_rValue );
  io_rChange.m_Mask |= EChangeProposed;
}
} // namespace

VEntryChange& VStoreWriter::Obtain( Entry i_pEntry )
{
  return m_rStore.Pending().ObtainForWrite( *i_pEntry );
}

VEntryChange* VStoreWriter::ObtainFor( Entry i_pEntry, const VTypedValue& i_rValue, const char* i_pMessage,
                                       IResult& o_rResult )
{
  if ( i_pEntry == nullptr )
  {
    o_rResult = IResult::InvalidHandle;
    return nullptr;
  }
  const IO::ISchema* const pSchema = i_rValue.Schema();
  if ( !Fits( *i_pEntry, pSchema ) )
  {
    Log( StoreCategory(), ELogFailure, i_pMessage, i_pEntry->m_Path.Text() );
    o_rResult = IResult::InvalidType;
    return nullptr;
  }
  VEntryChange& rChange = Obtain( i_pEntry );
  if ( rChange.m_pSchema == nullptr && pSchema->m_Type != IO::EType::Void )
  {
    rChange.m_pSchema = pSchema;
  }
  o_rResult = IResult::Ok;
  return &rChange;
}

void VStoreWriter::ClearUsingDefault( VEntryChange& io_rChange )
{
  io_rChange.m_Values.m_Flags &= ~std::uint32_t( EUsingDefault );
  io_rChange.m_Mask |= EUsingDefault;
}

IResult VStoreWriter::SetVerifiedValue( Entry i_pEntry, VTypedValue i_Value )
{
  IResult Result;
  VEntryChange* const pChange = ObtainFor(
      i_pEntry, i_Value, "Failed to set '%1%' verified value: the value type does not match the entry type.", Result );
  if ( pChange != nullptr )
  {
    SetVerified( *pChange, std::move( i_Value ) );
    if ( ( OverlaidFlags( i_pEntry ) & ( EUsingDefault | EVerifyRequired ) ) == EUsingDefault )
    {
      ClearUsingDefault( *pChange );
    }
  }
  return Result;
}

IResult VStoreWriter::SetProposedValue( Entry i_pEntry, VTypedValue i_Value )
{
  IResult Result;
  VEntryChange* const pChange = ObtainFor(
      i_pEntry, i_Value, "Failed to set '%1%' proposed value: the value type does not match the entry type.", Result );
  if ( pChange != nullptr )
  {
    SetProposed( *pChange, std::move( i_Value ) );
    // With EVerifyRequired too: a proposal is made by somebody, a verified value only answers it.
    if ( ( OverlaidFlags( i_pEntry ) & EUsingDefault ) != 0 )
    {
      ClearUsingDefault( *pChange );
    }
  }
  return Result;
}

IResult VStoreWriter::SetValue( Entry i_pEntry, VTypedValue i_Value )
{
  IResult Result;
  VEntryChange* const pChange = ObtainFor(
      i_pEntry, i_Value, "Failed to set '%1%' value: the value type does not match the entry type.", Result );
  if ( pChange != nullptr )
  {
    const std::uint32_t Word = OverlaidFlags( i_pEntry );
    ( Word & EVerifyRequired ) != 0 ? SetProposed( *pChange, std::move( i_Value ) )
                                    : SetVerified( *pChange, std::move( i_Value ) );
    if ( ( Word & EUsingDefault ) != 0 )
    {
      ClearUsingDefault( *pChange );
    }
  }
  return Result;
}

IResult VStoreWriter::SetDefaultValue( Entry i_pEntry, VTypedValue i_Value )
{
  IResult Result;
  VEntryChange* const pChange = ObtainFor(
      i_pEntry, i_Value, "Failed to set '%1%' default value: the value type does not match the entry type.", Result );
  if ( pChange == nullptr )
  {
    return Result;
  }
  // What is set here fits as well as the default does.
  const std::uint32_t Word = OverlaidFlags( i_pEntry );
  if ( ( Word & EReadout ) != 0 )
  {
    WarnReadoutDefault( i_pEntry );
  }
  if ( VStoreWriter::DefaultValue( i_pEntry ).IsEmpty() )
  {
    const bool bVerify = ( Word & EVerifyRequired ) != 0;
    if ( ( bVerify ? VStoreWriter::ProposedValue( i_pEntry ) : VStoreWriter::VerifiedValue( i_pEntry ) ).IsEmpty() )
    {
      Result = bVerify ? SetProposedValue( i_pEntry, i_Value ) : SetVerifiedValue( i_pEntry, i_Value );
      SetFlag( i_pEntry, EUsingDefault );
    }
  }
  else if ( ( Word & EUsingDefault ) != 0 )
  {
    Result = SetValue( i_pEntry, i_Value );
  }
  pChange->m_Values.m_Default = std::move( i_Value );
  pChange->m_Mask |= EChangeDefault;
  return Result;
}

void VStoreWriter::SetFlag( Entry i_pEntry, std::uint32_t i_Flags )
{
  SetFlags( i_pEntry, i_Flags, true );
}

void VStoreWriter::ClearFlag( Entry i_pEntry, std::uint32_t i_Flags )
{
  SetFlags( i_pEntry, i_Flags, false );
}

void VStoreWriter::SetFlags( Entry i_pEntry, std::uint32_t i_Flags, bool i_bOn )
{
  DebugServices::Check( ( i_Flags & ~std::uint32_t( EAllStoreFlags ) ) == 0, "( i_Flags & ~EAllStoreFlags ) == 0",
                        __FILE__, __LINE__ );
  const std::uint32_t Flags = i_Flags & EAllStoreFlags;
  if ( i_pEntry == nullptr )
  {
    return;
  }
  VEntryChange& rChange = Obtain( i_pEntry );
  const std::uint32_t Word = OverlaidFlags( i_pEntry );
  // An entry that only this scope knows has no values that another party could have agreed to.
  const bool bOld = i_pEntry->m_pState != nullptr;
  if ( ( Flags & EVerifyRequired ) != 0 && bOld && ( ( Word & EVerifyRequired ) != 0 ) != i_bOn )
  {
    if ( i_bOn && ( ( Flags | Word ) & EReadout ) != 0 )
    {
      WarnReadoutAndVerify( i_pEntry );
    }
    SwapValues( i_pEntry );
  }
  if ( i_bOn && ( Flags & EReadout ) != 0 && bOld && ( Word & EReadout ) == 0 )
  {
    if ( ( ( Flags | Word ) & EVerifyRequired ) != 0 )
    {
      WarnReadoutAndVerify( i_pEntry );
    }
    EmptyForReadout( i_pEntry, rChange );
  }
  rChange.m_Values.m_Flags = i_bOn ? rChange.m_Values.m_Flags | Flags : rChange.m_Values.m_Flags & ~Flags;
  rChange.m_Mask |= Flags;
}

void VStoreWriter::SwapValues( Entry i_pEntry )
{
  const VTypedValue Verified = VStoreWriter::VerifiedValue( i_pEntry );
  const VTypedValue Proposed = VStoreWriter::ProposedValue( i_pEntry );
  if ( Verified != Proposed )
  {
    (void)SetVerifiedValue( i_pEntry, Proposed );
    (void)SetProposedValue( i_pEntry, Verified );
  }
}

void VStoreWriter::EmptyForReadout( Entry i_pEntry, VEntryChange& io_rChange )
{
  const std::uint64_t Mask = io_rChange.m_Mask;
  const VEntryValues Saved = io_rChange.m_Values;
  (void)SetDefaultValue( i_pEntry, VTypedValue() );
  (void)SetProposedValue( i_pEntry, VTypedValue() );
  (void)SetVerifiedValue( i_pEntry, VTypedValue() );
  if ( ( Mask & EChangeDefault ) != 0 )
  {
    (void)SetDefaultValue( i_pEntry, Saved.m_Default );
    WarnReadoutDefault( i_pEntry );
  }
  if ( ( Mask & EChangeProposed ) != 0 )
  {
    (void)SetProposedValue( i_pEntry, Saved.m_Proposed );
  }
  if ( ( Mask & EChangeVerified ) != 0 )
  {
    (void)SetVerifiedValue( i_pEntry, Saved.m_Verified );
  }
}

void VStoreWriter::WarnReadoutAndVerify( Entry i_pEntry )
{
  Log( StoreCategory(), ELogFailure, "Setting both VerifyRequired and Readout is not supported %1%.",
       i_pEntry->m_Path.Text() );
}

void VStoreWriter::WarnReadoutDefault( Entry i_pEntry )
{
  Log( StoreCategory(), ELogWarning, "Set a default value on a Readout %1%.", i_pEntry->m_Path.Text() );
}

IResult VStoreWriter::SetSchema( Entry i_pEntry, const IO::ISchema* i_pSchema )
{
  if ( i_pEntry == nullptr )
  {
    return IResult::InvalidHandle;
  }
  const IO::ISchema* const pWanted = i_pSchema != nullptr ? i_pSchema : IO::GetUniquePodSchema( IO::EType::Void );
  const IO::ISchema* const pOld = OverlaidSchema( i_pEntry );
  if ( pOld == pWanted )
  {
    return IResult::OkButNoEffect;
  }
  if ( pOld->m_Type == IO::EType::Void )
  {
    Obtain( i_pEntry ).m_pSchema = pWanted;
    return IResult::Ok;
  }
  Log( StoreCategory(), ELogFailure,
       "Failed to set '%1%' value schema: the requested type does not match the entry type.", i_pEntry->m_Path.Text() );
  return IResult::InvalidType;
}

IResult VStoreWriter::RemoveEntry( Entry i_pEntry )
{
  return i_pEntry != nullptr ? m_rStore.Pending().Remove( *i_pEntry, true ) : IResult( IResult::NotFound );
}

void VStoreWriter::Touch( Entry i_pEntry )
{
  if ( i_pEntry != nullptr )
  {
    Obtain( i_pEntry ).m_Mask |= ChangeMask::Kept;
  }
}

void VStoreWriter::QueueChangeNotification( VEntryPatternSet i_Set, IBitFlags< EChangeFlags > i_Flags )
{
  if ( i_Flags.Bits() != 0 )
  {
    m_rStore.Queue( { std::move( i_Set ), i_Flags.Bits() } );
  }
}

void VStoreWriter::QueueVerificationCheck( VEntryPatternSet i_Set )
{
  m_rStore.Queue( { std::move( i_Set ), 0 } );
}

} // namespace Store
