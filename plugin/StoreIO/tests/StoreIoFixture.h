#pragma once

#include <Store/Store.h>
#include <StoreIO/StoreJson.h>
#include <TestSupport/LogGuard.h>
#include <ZEK/Serialiser.h>
#include <ZEK/StoreValue.h>

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace StoreIO
{

/// A store, and documents into and out of it.
struct VSettings
{
  std::shared_ptr< ZEK::IStore > m_pStore = ::Store::CreateStore( nullptr, 64 );

  ::Store::VStoreEntry* operator[]( const std::string& i_rPath ) const { return m_pStore->GetEntry( i_rPath ); }
  template < typename TWork >
  auto Write( const TWork& i_rWork ) const
  {
    ZEK::VStoreWriteScope Scope( *m_pStore );
    return i_rWork( *Scope );
  }
  template < typename TWork >
  auto Read( const TWork& i_rWork ) const
  {
    ZEK::VStoreReadScope Scope( *m_pStore );
    return i_rWork( *Scope );
  }
  template < typename T >
  void Set( const std::string& i_rPath, const T& i_rValue ) const
  {
    Write(
        [&]( ZEK::IStoreWriter& io_rWriter )
        {
          EXPECT_EQ( io_rWriter.SetValue( ( *this )[i_rPath], ZEK::IO::MakeValue( i_rValue ) ), ZEK::IResult::Ok );
        } );
  }
  ZEK::VTypedValue Verified( const std::string& i_rPath ) const
  {
    return Read(
        [&]( ZEK::IStoreReader& i_rReader )
        {
          return i_rReader.VerifiedValue( ( *this )[i_rPath] );
        } );
  }
  bool Exists( const std::string& i_rPath ) const
  {
    return Read(
        [&]( ZEK::IStoreReader& i_rReader )
        {
          return i_rReader.Exists( ( *this )[i_rPath] );
        } );
  }

  /// The result of reading, or of importing when that went well.
  ZEK::IResult Import( std::string_view i_Text ) const
  {
    VStoreImporterJson Importer;
    const ZEK::IResult Result = Importer.ReadText( i_Text );
    EXPECT_EQ( Result.IsError(), !Importer.ReadError().empty() );
    return Result.IsError() ? Result
                            : Write(
                                  [&Importer]( ZEK::IStoreWriter& io_rWriter )
                                  {
                                    return Importer.Import( io_rWriter );
                                  } );
  }
  ZEK::IResult Export( VStoreExporterJson& io_rExporter ) const
  {
    return Read(
        [&io_rExporter]( ZEK::IStoreReader& i_rReader )
        {
          return io_rExporter.Export( i_rReader );
        } );
  }
  std::string Text() const
  {
    VStoreExporterJson Exporter;
    std::string Made;
    EXPECT_EQ( Export( Exporter ), ZEK::IResult::Ok );
    EXPECT_EQ( Exporter.WriteText( Made ), ZEK::IResult::Ok );
    return Made;
  }
};

/// `{"Version":"3.0","Children":{…}}`
inline std::string Whole( const std::string& i_rChildren )
{
  return std::string( R"({"Version":"3.0","Children":{)" ).append( i_rChildren ).append( "}}" );
}

/// A test in which these are the lines of level 2 of the log category.
inline void ExpectLines( const std::vector< std::string >& i_rTexts, const std::string& i_rCategory = "StoreIO" )
{
  for ( const std::string& rText : i_rTexts )
  {
    TestSupport::ExpectFailureLine( rText );
  }
  EXPECT_EQ( TestSupport::LogTexts( i_rCategory, ZEK::ELogFailure ), i_rTexts );
}

} // namespace StoreIO
