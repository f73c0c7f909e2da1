#pragma once

#include <ZEK/Export.h>

#include <cstdint>
#include <string>

namespace ZEK
{

/// The result of an operation: a 32-bit code whose top bit marks a failure.
///
/// Codes below 0x80000000 are kinds of success, and a caller that tests for failure treats them alike.
class [[nodiscard]] IResult
{
public:
  enum ECode : std::uint32_t
  {
    Ok = 0,
    OkButNoEffect,
    OkButPartial,
    OkButFinished,
    OkButModified,
    Failed = 0x80000000u,
    FailedWithException,
    Finished,
    Stopping,
    NotImplemented,
    NotSupported,
    NotPermitted,
    NotAvailable,
    NotConnected,
    NotSet,
    NotFound,
    NotRequired,
    AlreadyPresent,
    AlreadyInProgress,
    AlreadySet,
    InvalidArgument,
    InvalidIndex,
    InvalidName,
    InvalidId,
    InvalidHandle,
    InvalidToken,
    InvalidPointer,
    InvalidFormat,
    InvalidType,
    InvalidVersion,
    InvalidSession,
    InvalidInfo,
    InvalidValue,
    InvalidSettings,
    ProtocolFailure,
    NetworkFailure,
    AllocationFailure,
    SerialisationFailure,
    FileIOFailure,
    TimedOut,
    WouldBlock,
    EndOfData,
    Conflict,
    FileNotOpen,
    ShuttingDown,
    DiskFull,
    Canceled,
    FileNotFound,
    RPCUnknown,
    RPCFailed,
    RPCInvalid,
    RPCNotConnected
  };

  constexpr IResult( ECode i_Code = Ok )
    : m_Code( i_Code )
  {
  }
  static constexpr IResult FromCode( std::uint32_t i_Code ) { return IResult( static_cast< ECode >( i_Code ) ); }

  constexpr std::uint32_t Code() const { return m_Code; }
  constexpr bool IsError() const { return m_Code >= 0x80000000u; }
  constexpr bool IsOk() const { return !IsError(); }

  /// The code's name, a colon and a sentence; "Unknown result code" for a code that has no name.
  ZEK_API std::string Text() const;

  friend constexpr bool operator==( IResult i_A, IResult i_B ) { return i_A.m_Code == i_B.m_Code; }

private:
  std::uint32_t m_Code;
};

} // namespace ZEK
