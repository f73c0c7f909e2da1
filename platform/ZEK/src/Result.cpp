#include <ZEK/Result.h>

#include <array>

namespace ZEK
{
namespace
{
constexpr std::uint32_t FirstFailure = 0x80000000u;

constexpr std::array< const char*, 5 > SuccessTexts{
    "Ok: The function succeeded", "OkButNoEffect: The function succeeded but had no effect",
    "OkButPartial: The function succeeded but was only partially applicable",
    "OkButFinished: Successfully finished - no further operation possible",
    "OkButModified: The function succeeded but one or more values or parameters were modified" };

// In the order of IResult::ECode: a code's place gives its value.
constexpr std::array FailureTexts{ "Failed: The function failed",
                                   "FailedWithException: The function generated an exception",
                                   "Finished: The service requested has finished",
                                   "Stopping: The service requested is stopping",
                                   "NotImplemented: The function is not implemented in this version",
                                   "NotSupported: The function is not supported",
                                   "NotPermitted: The function is not permitted at this time",
                                   "NotAvailable: The information requested was not available",
                                   "NotConnected: The required connection is not present",
                                   "NotSet: The requested information has not been set",
                                   "NotFound: The requested information, instance or type was not found",
                                   "NotRequired: The action requested is not necessary",
                                   "AlreadyPresent: The data or item being set was already present",
                                   "AlreadyInProgress: The operation requested is already in progress",
                                   "AlreadySet: The data or item being set is already set",
                                   "InvalidArgument: A supplied argument was invalid",
                                   "InvalidIndex: A supplied index was invalid or out of range",
                                   "InvalidName: A supplied name was invalid or unrecognized",
                                   "InvalidId: A supplied id was invalid or unrecognized",
                                   "InvalidHandle: A supplied handle was invalid",
                                   "InvalidToken: A supplied token was invalid",
                                   "InvalidPointer: A supplied pointer was invalid",
                                   "InvalidFormat: The data provided or requested was not in the expected format",
                                   "InvalidType: An incorrect type was provided",
                                   "InvalidVersion: An object or file was the wrong version",
                                   "InvalidSession: The session specified was not valid",
                                   "InvalidInfo: The information supplied was not valid",
                                   "InvalidValue: A value supplied was not valid",
                                   "InvalidSettings: The settings supplied were not valid",
                                   "ProtocolFailure: A protocol error was detected",
                                   "NetworkFailure: A network error occurred",
                                   "AllocationFailure: Failed to allocate memory or item",
                                   "SerialisationFailure: Failed during serialization/deserialization of data",
                                   "FileIOFailure: An operation to read or write a file failed",
                                   "TimedOut: The operation timed out",
                                   "WouldBlock: The operation failed as it would have had to block",
                                   "EndOfData: The operation failed as the end of a data stream has been reached",
                                   "Conflict: The operation detected a conflict",
                                   "FileNotOpen: The file is not open or could not be opened",
                                   "ShuttingDown: The operation failed because the component is shutting down",
                                   "DiskFull: No space left on device",
                                   "Canceled: The operation has been canceled",
                                   "FileNotFound: The file does not exist or is unreadable",
                                   "RPCUnknown: The remote call failed for an unknown reason",
                                   "RPCFailed: The remote call failed",
                                   "RPCInvalid: The remote call was invalid",
                                   "RPCNotConnected: The remote call has no connection" };

static_assert( FirstFailure + FailureTexts.size() - 1 == IResult::RPCNotConnected );
} // namespace

std::string IResult::Text() const
{
  if ( m_Code < SuccessTexts.size() )
  {
    return SuccessTexts[m_Code];
  }
  if ( m_Code >= FirstFailure && m_Code - FirstFailure < FailureTexts.size() )
  {
    return FailureTexts[m_Code - FirstFailure];
  }
  return "Unknown result code";
}

} // namespace ZEK
