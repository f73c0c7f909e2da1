#include "FakeStore.h"

#include <TestSupport/LogGuard.h>
#include <ZEK/StoreValue.h>

#include <gtest/gtest.h>

namespace
{
class StoreValue : public testing::Test
{
protected:
  void SetUp() override { ZEK::GlobalLog().Category( "Store" ).SetMaximumLevel( ZEK::ELogDetail ); }
  void TearDown() override { ZEK::GlobalLog().Category( "Store" ).SetMaximumLevel( ZEK::ELogWarning ); }

  /// The only line since the last look, as «level text»; nothing without one.
  std::string OneLine()
  {
    const auto Lines = TestSupport::LogLines();
    EXPECT_LE( Lines.size(), m_Seen + 1 );
    if ( std::exchange( m_Seen, Lines.size() ) == Lines.size() )
    {
      return "";
    }
    EXPECT_EQ( Lines.back().Category, "Store" );
    return std::to_string( Lines.back().Level ) + ' ' + Lines.back().Text;
  }

  /// What comes out of a scope that ends, with or without an exception of its own on the way.
  template < typename TScope >
  std::string Thrown( const char* i_pOwn )
  {
    try
    {
      TScope Scope( m_Store );
      if ( i_pOwn != nullptr )
      {
        throw std::logic_error( i_pOwn );
      }
    }
    catch ( const std::exception& rError )
    {
      return rError.what();
    }
    return "";
  }

  std::size_t m_Seen = 0;
  VFakeStore m_Store;
};
} // namespace

TEST_F( StoreValue, TypedReadsSayWhyTheyFail )
{
  using ZEK::IResult;
  auto& rValues = m_Store.m_Reader.m_Values;
  rValues[m_Store.GetEntry( "a/int" )] = ZEK::IO::MakeValue( 7 );
  rValues[m_Store.GetEntry( "a/text" )] = ZEK::IO::MakeValue( "x" );
  rValues[m_Store.GetEntry( "a/empty" )] = {};
  rValues[m_Store.GetEntry( "a/bad%1%" )] =
      ZEK::VTypedValue( ZEK::IO::VSerialiser< std::int32_t >::Schema(), ZEK::IO::VValueBytes( "12", 2 ) );
  m_Store.GetEntry( "a/handle" );
  struct VRow
  {
    const char* pPath;
    IResult::ECode Code;
    const char* pLine;
  };
  const VRow Rows[] = {
      { "a/int", IResult::Ok, "" },
      { "a/text", IResult::InvalidType,
        "2 Failed getting value for store entry 'a/text': the requested value type does not match the store value "
        "type." },
      { "a/empty", IResult::NotSet, "6 Store entry 'a/empty' has no value." },
      { "a/bad%1%", IResult::Failed,
        "2 Failed getting value for store entry 'a/bad%1%': encountered an unknown error." },
      { "a/handle", IResult::NotFound, "6 Store entry 'a/handle' does not exist." },
      { "a/absent", IResult::NotFound, "6 Store entry 'a/absent' does not exist." },
      { "a/*", IResult::InvalidArgument, "" } };
  for ( const VRow& rRow : Rows )
  {
    if ( rRow.pLine[0] == '2' )
    {
      TestSupport::ExpectFailureLine( rRow.pLine + 2 );
    }
    std::int32_t Value = -1;
    EXPECT_EQ( ZEK::ReadValue( m_Store.m_Reader, rRow.pPath, Value ), rRow.Code ) << rRow.pPath;
    EXPECT_EQ( OneLine(), rRow.pLine );
    EXPECT_EQ( Value, rRow.Code == IResult::Ok ? 7 : -1 ) << rRow.pPath;
    Store::VStoreEntry* const pEntry = m_Store.FindEntry( rRow.pPath );
    if ( pEntry == nullptr || rRow.Code == IResult::Ok )
    {
      continue;
    }
    try
    {
      ZEK::GetValue< std::int32_t >( m_Store.m_Reader, pEntry );
      ADD_FAILURE() << rRow.pPath;
    }
    catch ( const ZEK::VStoreException& rError )
    {
      EXPECT_EQ( rError.m_Result, rRow.Code );
      EXPECT_EQ( rError.what(), std::string( rRow.pLine + 2 ) );
    }
    EXPECT_EQ( OneLine(), "" );
  }
  EXPECT_EQ( m_Store.FindEntry( "a/absent" ), nullptr ); // reading makes no handle
  EXPECT_EQ( ZEK::GetValue< std::int32_t >( m_Store.m_Reader, m_Store.FindEntry( "a/int" ) ), 7 );
  std::int32_t Value = 0;
  EXPECT_EQ( ZEK::ReadValue( m_Store.m_Reader, static_cast< Store::VStoreEntry* >( nullptr ), Value ),
             IResult::NotFound );
}

TEST_F( StoreValue, ScopesEndOnceAndLetOneExceptionOut )
{
  {
    const ZEK::VStoreReadScope Read( m_Store );
    const ZEK::VStoreWriteScope Refused( m_Store );
    EXPECT_FALSE( Refused );
    EXPECT_EQ( Read.operator->(), &m_Store.m_Reader );
    EXPECT_EQ( m_Store.m_Reads, 1 );
  }
  EXPECT_EQ( m_Store.m_Reads, 0 );
  EXPECT_EQ( m_Store.m_Writes, 0 );

  m_Store.m_pThrown = "of a callback";
  const std::string Line = "A callback failed while another failure was on its way: of a callback.";
  TestSupport::ExpectFailureLine( Line );
  EXPECT_EQ( Thrown< ZEK::VStoreReadScope >( nullptr ), "of a callback" );
  EXPECT_EQ( Thrown< ZEK::VStoreWriteScope >( nullptr ), "of a callback" );
  EXPECT_EQ( OneLine(), "" );
  EXPECT_EQ( Thrown< ZEK::VStoreReadScope >( "own" ), "own" );
  EXPECT_EQ( OneLine(), "2 " + Line );
  EXPECT_EQ( Thrown< ZEK::VStoreWriteScope >( "own" ), "own" );
  EXPECT_EQ( OneLine(), "2 " + Line );
  EXPECT_EQ( m_Store.m_Reads, 0 );
  EXPECT_EQ( m_Store.m_Writes, 2 );
}

TEST( HandlerCallbackProxy, PassesItsMaskAndMode )
{
  struct VCall
  {
    char Kind;
    std::uint64_t Mask;
    std::uint32_t Mode;
    bool operator==( const VCall& ) const = default;
  };
  class VHandler final : public ZEK::IHandlerCallback, public std::enable_shared_from_this< VHandler >
  {
  public:
    std::vector< VCall > m_Calls;
    ZEK::CallbackId m_Removed = nullptr;

    ZEK::IHandlerCallbackProxy CreateProxy( std::uint64_t i_Mask, std::uint32_t i_Mode ) override
    {
      return { shared_from_this(), i_Mask, i_Mode };
    }
    ZEK::CallbackId AddCallback( ZEK::ChangeFunction, std::uint64_t i_Mask, std::uint32_t i_Mode ) override
    {
      return Note( { 'p', i_Mask, i_Mode } );
    }
    ZEK::CallbackId AddCallbackOn( const std::shared_ptr< ZEK::IPostalService >& i_rpService, ZEK::ChangeFunction,
                                   std::uint64_t i_Mask, std::uint32_t i_Mode ) override
    {
      return Note( { i_rpService ? 'o' : 'n', i_Mask, i_Mode } );
    }
    ZEK::CallbackId AddImmediateCallback( ZEK::ChangeFunction, std::uint64_t i_Mask ) override
    {
      return Note( { 'i', i_Mask, 0 } );
    }
    std::size_t RemoveCallbacksWithMask( std::uint64_t i_Mask ) override { return i_Mask + 1; }
    bool RemoveCallback( ZEK::CallbackId i_Id ) override
    {
      m_Removed = i_Id;
      return true;
    }
    void RemoveAllCallbacks() override {}
    std::size_t CountCallbacksWithMask( std::uint64_t i_Mask ) const override { return i_Mask + 2; }
    std::size_t CountCallbacks() const override { return 0; }

  private:
    ZEK::CallbackId Note( VCall i_Call )
    {
      m_Calls.push_back( i_Call );
      return reinterpret_cast< ZEK::CallbackId >( m_Calls.size() );
    }
  };
  struct VPost final : ZEK::IPostalService
  {
    void Post( std::function< void() > ) override {}
  };
  auto pHandler = std::make_shared< VHandler >();
  ZEK::IHandlerCallbackProxy Proxy = pHandler->CreateProxy( 5, 1 );
  const auto pPost = std::make_shared< VPost >();
  EXPECT_EQ( Proxy.Connect( nullptr ), reinterpret_cast< ZEK::CallbackId >( 1 ) );
  Proxy.ConnectOn( nullptr, pPost );
  Proxy.ConnectImmediate( nullptr );
  ZEK::VConnection Posted = Proxy.Connect( nullptr, pPost ), Immediate = Proxy.Connect( nullptr, nullptr );
  EXPECT_EQ( pHandler->m_Calls,
             ( std::vector< VCall >{ { 'p', 5, 1 }, { 'o', 5, 1 }, { 'i', 5, 0 }, { 'o', 5, 1 }, { 'i', 5, 0 } } ) );
  Posted.Disconnect();
  EXPECT_EQ( pHandler->m_Removed, reinterpret_cast< ZEK::CallbackId >( 4 ) );
  EXPECT_TRUE( Proxy.Disconnect( reinterpret_cast< ZEK::CallbackId >( 2 ) ) );
  EXPECT_EQ( pHandler->m_Removed, reinterpret_cast< ZEK::CallbackId >( 2 ) );
  EXPECT_EQ( Proxy.DisconnectAll(), 6u );
  EXPECT_EQ( Proxy.Count(), 7u );
  const std::weak_ptr< VHandler > pWeak = pHandler;
  pHandler.reset();
  EXPECT_FALSE( pWeak.expired() ); // the proxy keeps it, a connection does not
  Proxy = { nullptr, 0, 0 };
  EXPECT_TRUE( pWeak.expired() );
  Immediate.Disconnect();
}
