#include <ZEK/Result.h>
#include <ZEK/ResultQml.h>

#include <gtest/gtest.h>

#include <utility>

using ZEK::IResult;

TEST( IResult, TextsOfTheTableStandAtTheirCodes )
{
  const std::pair< std::uint32_t, const char* > Rows[] = {
      { 0, "Ok: The function succeeded" },
      { 1, "OkButNoEffect: The function succeeded but had no effect" },
      { 2, "OkButPartial: The function succeeded but was only partially applicable" },
      { 3, "OkButFinished: Successfully finished - no further operation possible" },
      { 4, "OkButModified: The function succeeded but one or more values or parameters were modified" },
      { 0x80000000, "Failed: The function failed" },
      { 0x8000000a, "NotFound: The requested information, instance or type was not found" },
      { 0x80000017, "InvalidType: An incorrect type was provided" },
      { 0x80000020, "SerialisationFailure: Failed during serialization/deserialization of data" },
      { 0x80000028, "DiskFull: No space left on device" },
      { 0x8000002a, "FileNotFound: The file does not exist or is unreadable" },
      { 0x8000002b, "RPCUnknown: The remote call failed for an unknown reason" },
      { 0x8000002e, "RPCNotConnected: The remote call has no connection" },
      { 5, "Unknown result code" },
      { 0x8000002f, "Unknown result code" },
      { 0xffffffff, "Unknown result code" } };
  for ( const auto& [Code, pText] : Rows )
  {
    EXPECT_EQ( IResult::FromCode( Code ).Text(), pText ) << std::hex << Code;
  }
}

TEST( IResult, TheTopBitAloneMarksAFailure )
{
  EXPECT_TRUE( IResult::FromCode( 0x7fffffff ).IsOk() );
  EXPECT_TRUE( IResult::FromCode( 0x80000000 ).IsError() );
  EXPECT_TRUE( IResult( IResult::OkButModified ).IsOk() );
  EXPECT_EQ( IResult(), IResult::Ok );
}

TEST( IResult, QmlSingletonAnswersByNameAndByCode )
{
  const ZEK::IO::VResultNamespaceObjectQml Result;
  EXPECT_EQ( Result.code( "NotFound" ), 0x8000000a );
  EXPECT_EQ( Result.code( "OkButFinished" ), 3u );
  EXPECT_EQ( Result.code( "RPCNotConnected" ), 0x8000002e );
  EXPECT_EQ( Result.code( "Ok" ), 0u );
  EXPECT_EQ( Result.category( 4 ), 0 );
  EXPECT_EQ( Result.category( 0x80000002 ), 1 );
  EXPECT_TRUE( Result.isOk( 1 ) && !Result.isError( 1 ) && Result.isError( 0x80000001 ) );
  EXPECT_EQ( Result.description( 0x80000029 ), "Canceled: The operation has been canceled" );
}
