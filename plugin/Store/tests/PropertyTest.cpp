#include "StoreFixture.h"
#include "StoreModel.h"

#include <ZEK/Log.h>

#include <gtest/gtest.h>

#include <cstdlib>
#include <random>
#include <set>

using namespace ZEK;
using namespace Store;

namespace
{
const std::vector< std::string > Paths{ "a",       "a/b", "a/b/c",   "a/b/d", "a/c",  "a/c/b/d", "b",  "b/b",
                                        "b/a/b/c", "c/a", "c/a/b/c", "d/",    "d//b", "a/b/*",   "a!", "aa/b" };
const std::vector< std::string > Patterns{ "",        "*",     "a/*", "*/b",   "*/*",  "a/b/*", "*/*/c",
                                           "*/*/*/*", "a/*/c", "a/b", "d/*/b", "*/b/", "d//b" };
const std::vector< const IO::ISchema* > Types{ IO::GetUniquePodSchema( IO::EType::Void ),
                                               IO::GetUniquePodSchema( IO::EType::Int32 ),
                                               IO::GetUniquePodSchema( IO::EType::String ) };

std::vector< std::string > Components( const std::string& i_rText )
{
  std::vector< std::string > Found;
  for ( std::size_t Begin = 0; !i_rText.empty() && Begin <= i_rText.size(); )
  {
    const std::size_t End = std::min( i_rText.find( '/', Begin ), i_rText.size() );
    Found.push_back( i_rText.substr( Begin, End - Begin ) );
    Begin = End + 1;
  }
  return Found;
}

bool Matches( const std::string& i_rPattern, const std::string& i_rPath )
{
  const std::vector< std::string > Wanted = Components( i_rPattern ), Given = Components( i_rPath );
  return std::equal( Wanted.begin(), Wanted.end(), Given.begin(), Given.end(),
                     []( const std::string& i_rA, const std::string& i_rB )
                     {
                       return i_rA == "*" || i_rA == i_rB;
                     } );
}

/// One store and one model that are told the same.
class VTwins
{
public:
  explicit VTwins( unsigned i_Seed )
    : m_Random( i_Seed )
    , m_Model( Paths )
    , m_Store( 1 + i_Seed % 7 )
  {
    for ( const auto& [rPath, rNode] : m_Model.Nodes() )
    {
      m_Names.push_back( rPath );
      // Every second handle exists before it is asked for by a write.
      if ( m_Names.size() % 2 == 0 )
      {
        Listen( rPath, m_Store.OnEntry( rPath.c_str() ), false );
      }
    }
    for ( const std::string& rPattern : Patterns )
    {
      Listen( rPattern, m_Store.OnPattern( rPattern.c_str() ), true );
      std::copy_if( m_Names.begin(), m_Names.end(), std::back_inserter( m_Matching[rPattern] ),
                    [&rPattern]( const std::string& i_rPath )
                    {
                      return Matches( rPattern, i_rPath );
                    } );
    }
  }

  void Scope( unsigned i_Number )
  {
    IStoreWriter& rWriter = *m_Store.m_pStore->BeginWrite();
    std::vector< std::pair< VEntryPatternSet, std::uint64_t > > Requests;
    for ( unsigned Left = 1 + Pick( 8 ); Left != 0; --Left )
    {
      Step( rWriter );
      Compare( rWriter, true, Left == 1 || Pick( 4 ) == 0 );
      ASSERT_FALSE( testing::Test::HasFailure() ) << "in scope " << i_Number;
    }
    ASSERT_EQ( m_Store.m_pStore->Pending().InUse(), m_Model.RecordCount() );
    std::map< std::string, bool > Old;
    for ( const auto& [rPath, rNode] : m_Model.Nodes() )
    {
      Old[rPath] = rNode.m_bOld;
    }
    m_Told.clear();
    m_Store.m_pStore->EndWrite();
    const std::uint64_t Id = m_Store.m_pStore->LastCommit();
    m_Model.Commit( Id );
    CompareTold( Old, Id );
    const VStoreReadScope Read( *m_Store.m_pStore );
    Compare( *Read, false, true );
    ASSERT_EQ( m_Store.m_pStore->Pending().InUse(), 0u );
    ASSERT_FALSE( testing::Test::HasFailure() ) << "after scope " << i_Number;
  }

private:
  unsigned Pick( unsigned i_Count ) { return static_cast< unsigned >( m_Random() % i_Count ); }
  VTypedValue Value()
  {
    switch ( Pick( 8 ) )
    {
    case 0:
      return VTypedValue();
    case 1:
      return IO::MakeValue( std::string( "text" ) );
    case 2:
      return IO::MakeValue( std::string( "longer than what lies in the object" ) );
    default:
      return Int( static_cast< std::int32_t >( Pick( 3 ) ) );
    }
  }
  std::string Text() { return std::vector< std::string >{ "", "x", "a text of some length, really" }[Pick( 3 )]; }

  void Listen( const std::string& i_rName, const std::shared_ptr< IHandlerCallback >& i_rpHandler, bool i_bPattern )
  {
    m_Handlers.push_back( i_rpHandler );
    i_rpHandler->AddImmediateCallback(
        [this, Key = std::pair( i_bPattern, i_rName )]( IBitFlags< EChangeFlags > i_Flags, ChangeId i_Id )
        {
          EXPECT_TRUE( m_Told.emplace( Key, std::pair( i_Flags.Bits(), i_Id.Value() ) ).second ) << "told twice";
        },
        ChangeMask::All );
  }

  void Step( IStoreWriter& io_rWriter )
  {
    // Half of the steps stay with the entry of the last one: what they do to each other is where faults hide.
    m_Name = Pick( 2 ) == 0 && !m_Name.empty() ? m_Name : m_Names[Pick( static_cast< unsigned >( m_Names.size() ) )];
    const std::string Name = m_Name;
    VStoreEntry* const pEntry = m_Store.m_pStore->GetEntry( Name );
    const unsigned What = Pick( 20 );
    const auto Same = [&]( IResult i_Store, IResult i_Model )
    {
      EXPECT_EQ( i_Store.Text(), i_Model.Text() ) << What << " on " << Name;
    };
    if ( What < 4 )
    {
      StepValue( io_rWriter, Name, pEntry, What );
    }
    else if ( What < 9 )
    {
      StepChoices( io_rWriter, Name, pEntry, What );
    }
    else if ( What < 12 )
    {
      const std::uint32_t Flags = std::vector< std::uint32_t >{ 1, 2, 16, 64, 512, 16 | 64, 80 | 1, 0 }[Pick( 8 )];
      const bool bOn = Pick( 3 ) != 0;
      io_rWriter.SetFlags( pEntry, Flags, bOn );
      m_Model.SetFlags( Name, Flags, bOn );
    }
    else if ( What < 15 )
    {
      StepText( io_rWriter, Name, pEntry );
    }
    else if ( What < 18 )
    {
      Same( io_rWriter.RemoveEntry( pEntry ), m_Model.Remove( Name ) );
    }
    else if ( What == 18 )
    {
      io_rWriter.Touch( pEntry );
      m_Model.Touch( Name );
    }
    else
    {
      const IO::ISchema* const pSchema = Types[Pick( 3 )];
      Same( io_rWriter.SetSchema( pEntry, pSchema ), m_Model.SetSchema( Name, pSchema ) );
    }
  }

  void StepValue( IStoreWriter& io_rWriter, const std::string& i_rName, VStoreEntry* i_pEntry, unsigned i_What )
  {
    const VTypedValue New = Value();
    const auto Set = i_What == 0   ? &IStoreWriter::SetVerifiedValue
                     : i_What == 1 ? &IStoreWriter::SetProposedValue
                     : i_What == 2 ? &IStoreWriter::SetValue
                                   : &IStoreWriter::SetDefaultValue;
    const IResult Model = i_What == 3 ? m_Model.SetDefault( i_rName, New )
                                      : m_Model.SetTyped( i_rName, i_What == 2 ? 0 : 16 + i_What, New );
    EXPECT_EQ( ( io_rWriter.*Set )( i_pEntry, New ).Text(), Model.Text() ) << i_What << " on " << i_rName;
  }

  void StepChoices( IStoreWriter& io_rWriter, const std::string& i_rName, VStoreEntry* i_pEntry, unsigned i_What )
  {
    const VTypedValue New = Value();
    const std::string First = Text(), Second = Text();
    const std::size_t Index = Pick( 3 );
    IResult Given, Wanted;
    switch ( i_What )
    {
    case 4:
      Given = io_rWriter.SetMinimum( i_pEntry, New );
      Wanted = m_Model.SetTyped( i_rName, 24, New );
      break;
    case 5:
      Given = io_rWriter.AddValueChoice( i_pEntry, New, First, Second );
      Wanted = m_Model.AddChoice( i_rName, New, First, Second );
      break;
    case 6:
      Given = io_rWriter.RemoveValueChoice( i_pEntry, Index );
      Wanted = m_Model.RemoveChoice( i_rName, Index );
      break;
    case 7:
      Given = io_rWriter.ClearValueChoices( i_pEntry );
      Wanted = m_Model.ClearChoices( i_rName );
      break;
    default:
      Given = io_rWriter.SetChoiceToolTip( i_pEntry, Index, First );
      Wanted = m_Model.SetToolTip( i_rName, Index, First );
    }
    EXPECT_EQ( Given.Text(), Wanted.Text() ) << i_What << " on " << i_rName;
  }

  void StepText( IStoreWriter& io_rWriter, const std::string& i_rName, VStoreEntry* i_pEntry )
  {
    const std::string New = Text();
    const VModelField Field = New.empty() ? VModelField() : VModelField{ New };
    const std::uint32_t Number = Pick( 3 );
    switch ( Pick( 9 ) )
    {
    case 0:
      io_rWriter.SetPresentationText( i_pEntry, New );
      return m_Model.SetPlain( i_rName, 29, Field );
    case 1:
      io_rWriter.SetOptionalText( i_pEntry, New );
      return m_Model.SetPlain( i_rName, 32, { New } );
    case 2:
      io_rWriter.ClearOptionalText( i_pEntry );
      return m_Model.SetPlain( i_rName, 32, {} );
    case 3:
      io_rWriter.SetExtraText1( i_pEntry, New );
      return m_Model.SetPlain( i_rName, 33, Field );
    case 4:
      io_rWriter.SetExtraText2( i_pEntry, New );
      return m_Model.SetPlain( i_rName, 34, Field );
    case 5:
      io_rWriter.SetExtraText3( i_pEntry, New );
      return m_Model.SetPlain( i_rName, 35, Field );
    case 6:
      io_rWriter.SetExtraNumber1( i_pEntry, Number );
      return m_Model.SetPlain( i_rName, 36, Number == 0 ? VModelField() : VModelField{ std::to_string( Number ) } );
    case 7:
      io_rWriter.SetExtraNumber2( i_pEntry, Number );
      return m_Model.SetPlain( i_rName, 37, Number == 0 ? VModelField() : VModelField{ std::to_string( Number ) } );
    default:
      io_rWriter.SetAttributesText( i_pEntry, New );
      return m_Model.SetPlain( i_rName, 38, Field );
    }
  }

  void Compare( const IStoreReader& i_rReader, bool i_bOpen, bool i_bFields )
  {
    for ( const auto& [rPath, rNode] : m_Model.Nodes() )
    {
      VStoreEntry* const pEntry = m_Store.m_pStore->FindEntry( rPath );
      const bool bThere = m_Model.Exists( rPath );
      if ( pEntry == nullptr )
      {
        EXPECT_FALSE( bThere ) << rPath;
        continue;
      }
      EXPECT_EQ( i_rReader.Exists( pEntry ), bThere ) << rPath;
      CompareChildren( i_rReader, rPath, pEntry );
      EXPECT_EQ( i_rReader.Flags( pEntry ), m_Model.Flags( rPath ) ) << rPath;
      EXPECT_EQ( i_rReader.Schema( pEntry ), m_Model.Schema( rPath ) ) << rPath;
      for ( std::size_t Place = i_bFields ? 0 : FieldBits.size(); Place < FieldBits.size(); ++Place )
      {
        const unsigned Field = FieldBits[Place];
        EXPECT_EQ( FieldOf( i_rReader, pEntry, Field ), m_Model.Read( rPath, Field ) ) << rPath << " field " << Field;
      }
      if ( !i_bOpen )
      {
        const VChangeIds Ids = i_rReader.ChangeIds( pEntry );
        const std::array< std::uint64_t, 5 > Stamps{ Ids.m_Verified.Value(), Ids.m_Proposed.Value(),
                                                     Ids.m_Other.Value(), Ids.m_Child.Value(),
                                                     Ids.m_Descendant.Value() };
        EXPECT_EQ( Stamps, rNode.m_Stamps ) << rPath;
      }
    }
    ComparePatterns( i_rReader );
  }

  void CompareChildren( const IStoreReader& i_rReader, const std::string& i_rPath, VStoreEntry* i_pEntry )
  {
    std::vector< std::string > Shown;
    for ( VStoreEntry* const pChild : i_rReader.Children( i_pEntry ) )
    {
      Shown.push_back( pChild->m_Path.Text() );
      EXPECT_EQ( i_rReader.Child( i_pEntry, pChild->m_Path.Leaf() ), pChild );
    }
    EXPECT_EQ( Shown, m_Model.Children( i_rPath ) ) << i_rPath;
    EXPECT_EQ( i_rReader.ChildCount( i_pEntry ), Shown.size() ) << i_rPath;
    EXPECT_EQ( i_rReader.HasChildren( i_pEntry ), !Shown.empty() ) << i_rPath;
    EXPECT_EQ( i_rReader.Child( i_pEntry, "nobody" ), nullptr );
  }

  void ComparePatterns( const IStoreReader& i_rReader )
  {
    for ( const std::string& rPattern : Patterns )
    {
      std::multiset< std::string > Shown, Wanted;
      for ( VStoreEntry* const pEntry : i_rReader.FindEntries( rPattern ) )
      {
        Shown.insert( pEntry->m_Path.Text() );
      }
      for ( const std::string& rPath : m_Matching[rPattern] )
      {
        if ( m_Model.Exists( rPath ) )
        {
          Wanted.insert( rPath );
        }
      }
      EXPECT_EQ( Shown, Wanted ) << "pattern " << rPattern;
    }
  }

  void CompareTold( const std::map< std::string, bool >& i_rOld, std::uint64_t i_Id )
  {
    std::map< std::pair< bool, std::string >, std::pair< std::uint64_t, std::uint64_t > > Wanted;
    for ( const auto& [rPath, rNode] : m_Model.Nodes() )
    {
      if ( rNode.m_Told == 0 )
      {
        continue;
      }
      if ( ( std::distance( m_Names.begin(), std::find( m_Names.begin(), m_Names.end(), rPath ) ) + 1 ) % 2 == 0 )
      {
        Wanted[{ false, rPath }] = { rNode.m_Told, i_Id };
      }
      for ( const std::string& rPattern : Patterns )
      {
        if ( Matches( rPattern, rPath ) && ( rNode.m_bOld || i_rOld.at( rPath ) ) )
        {
          auto& rTold = Wanted[{ true, rPattern }];
          rTold = { rTold.first | rNode.m_Told, i_Id };
        }
      }
    }
    EXPECT_EQ( m_Told, Wanted );
  }

  std::mt19937 m_Random;
  std::string m_Name;
  VStoreModel m_Model;
  VTestStore m_Store;
  std::vector< std::string > m_Names;
  std::map< std::string, std::vector< std::string > > m_Matching; ///< paths by pattern
  std::vector< std::shared_ptr< IHandlerCallback > > m_Handlers;
  std::map< std::pair< bool, std::string >, std::pair< std::uint64_t, std::uint64_t > > m_Told;
};
} // namespace

TEST( StoreProperty, RandomScopesShowAndTellWhatTheModelDoes )
{
  VLogCategory& rCategory = GlobalLog().Category( "Store" );
  rCategory.SetMaximumLevel( 0 );
  const char* const pSeed = std::getenv( "STORE_SEED" );
  const unsigned First = pSeed != nullptr ? static_cast< unsigned >( std::atoi( pSeed ) ) : std::random_device()();
  std::cout << "first seed " << First << std::endl;
  for ( unsigned Seed = First; Seed != First + 30 && !HasFailure(); ++Seed )
  {
    SCOPED_TRACE( "seed " + std::to_string( Seed ) );
    VTwins Twins( Seed );
    for ( unsigned Number = 0; Number < 100 && !HasFailure(); ++Number )
    {
      Twins.Scope( Number );
    }
  }
  rCategory.SetMaximumLevel( ELogWarning );
}
