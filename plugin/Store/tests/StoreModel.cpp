#include "StoreModel.h"

#include <algorithm>
#include <functional>

namespace Store
{

using namespace ZEK;

namespace
{
constexpr std::uint64_t Bit( unsigned i_Bit )
{
  return std::uint64_t( 1 ) << i_Bit;
}
constexpr std::uint64_t Replaced = Bit( 49 ) | Bit( 52 );

std::string Encode( const VTypedValue& i_rValue )
{
  std::string Text( 1, static_cast< char >( 'A' + static_cast< int >( i_rValue.Schema()->m_Type ) ) );
  return Text.append( i_rValue.m_Data.begin(), i_rValue.m_Data.end() );
}

bool HasBytes( const VModelField& i_rField )
{
  return !i_rField.empty() && i_rField.front().size() > 1;
}

VModelField FieldOf( const std::string& i_rText )
{
  return i_rText.empty() ? VModelField() : VModelField{ i_rText };
}

VModelField FieldOf( std::uint32_t i_Number )
{
  return i_Number == 0 ? VModelField() : VModelField{ std::to_string( i_Number ) };
}

void DropIfAllEmpty( VModelField& io_rTexts )
{
  if ( std::all_of( io_rTexts.begin(), io_rTexts.end(), std::mem_fn( &std::string::empty ) ) )
  {
    io_rTexts.clear();
  }
}
} // namespace

VModelField FieldOf( const VTypedValue& i_rValue )
{
  const std::string Text = Encode( i_rValue );
  return Text == "A" ? VModelField() : VModelField{ Text };
}

VModelField FieldOf( const IStoreReader& i_rReader, IStoreReader::Entry i_pEntry, unsigned i_Bit )
{
  VModelField Choices;
  switch ( i_Bit )
  {
  case 16:
    return FieldOf( i_rReader.VerifiedValue( i_pEntry ) );
  case 17:
    return FieldOf( i_rReader.ProposedValue( i_pEntry ) );
  case 18:
    return FieldOf( i_rReader.DefaultValue( i_pEntry ) );
  case 24:
    return FieldOf( i_rReader.Minimum( i_pEntry ) );
  case 25:
    return FieldOf( i_rReader.Maximum( i_pEntry ) );
  case 26:
    for ( const VTypedValue& rChoice : i_rReader.Choices( i_pEntry ) )
    {
      Choices.push_back( Encode( rChoice ) );
    }
    return Choices;
  case 27:
    return i_rReader.ChoiceTexts( i_pEntry );
  case 28:
    return i_rReader.ChoiceToolTips( i_pEntry );
  case 29:
    return FieldOf( i_rReader.PresentationText( i_pEntry ) );
  case 32:
    return i_rReader.OptionalText( i_pEntry ) ? VModelField{ *i_rReader.OptionalText( i_pEntry ) } : VModelField();
  case 33:
    return FieldOf( i_rReader.ExtraText1( i_pEntry ) );
  case 34:
    return FieldOf( i_rReader.ExtraText2( i_pEntry ) );
  case 35:
    return FieldOf( i_rReader.ExtraText3( i_pEntry ) );
  case 36:
    return FieldOf( i_rReader.ExtraNumber1( i_pEntry ) );
  case 37:
    return FieldOf( i_rReader.ExtraNumber2( i_pEntry ) );
  default:
    return FieldOf( i_rReader.Attributes( i_pEntry ) );
  }
}

VStoreModel::VStoreModel( const std::vector< std::string >& i_rPaths )
{
  for ( std::string Path : i_rPaths )
  {
    for ( ; !Path.empty(); Path = ParentOf( Path ) )
    {
      m_Nodes[Path];
    }
  }
  m_Nodes[""];
  for ( const auto& [rPath, rNode] : m_Nodes )
  {
    m_Children[rPath];
    if ( !rPath.empty() )
    {
      m_Children[ParentOf( rPath )].push_back( rPath );
    }
  }
  for ( auto& [rPath, rChildren] : m_Children )
  {
    std::sort( rChildren.begin(), rChildren.end(),
               []( const std::string& i_rA, const std::string& i_rB )
               {
                 return LeafOf( i_rA ) < LeafOf( i_rB );
               } );
  }
}

std::string VStoreModel::ParentOf( const std::string& i_rPath )
{
  const std::size_t Slash = i_rPath.rfind( '/' );
  return Slash == std::string::npos ? "" : i_rPath.substr( 0, Slash );
}

std::string VStoreModel::LeafOf( const std::string& i_rPath )
{
  return i_rPath.substr( i_rPath.rfind( '/' ) + 1 );
}

bool VStoreModel::Exists( const std::string& i_rPath ) const
{
  const VNode& rNode = m_Nodes.at( i_rPath );
  return rNode.m_Record ? ( rNode.m_Record->m_Mask & ERemoved ) == 0 : rNode.m_bOld;
}

std::vector< std::string > VStoreModel::Children( const std::string& i_rPath ) const
{
  std::vector< std::string > Found;
  for ( const std::string& rPath : m_Children.at( i_rPath ) )
  {
    if ( Exists( rPath ) )
    {
      Found.push_back( rPath );
    }
  }
  return Found;
}

VModelField VStoreModel::Read( const std::string& i_rPath, unsigned i_Bit ) const
{
  const VNode& rNode = m_Nodes.at( i_rPath );
  const VFields* pFields = &rNode.m_Fields;
  if ( rNode.m_Record && ( rNode.m_Record->m_Mask & Bit( i_Bit ) ) != 0 )
  {
    pFields = &rNode.m_Record->m_Fields;
  }
  else if ( !rNode.m_bOld || ( rNode.m_Record && ( rNode.m_Record->m_Mask & Replaced ) != 0 ) )
  {
    return {};
  }
  const auto It = pFields->find( i_Bit );
  return It != pFields->end() ? It->second : VModelField();
}

std::uint32_t VStoreModel::Flags( const std::string& i_rPath ) const
{
  const VNode& rNode = m_Nodes.at( i_rPath );
  std::uint32_t Old = rNode.m_bOld ? rNode.m_Flags : 0;
  if ( rNode.m_Record )
  {
    const auto Mask = static_cast< std::uint32_t >( rNode.m_Record->m_Mask & 0x3ff );
    Old = ( rNode.m_Record->m_Mask & Replaced ) != 0 ? 0 : Old;
    return ( Old & ~Mask ) | ( rNode.m_Record->m_Flags & Mask );
  }
  return Old;
}

const IO::ISchema* VStoreModel::Schema( const std::string& i_rPath ) const
{
  const VNode& rNode = m_Nodes.at( i_rPath );
  const IO::ISchema* const pVoid = IO::GetUniquePodSchema( IO::EType::Void );
  if ( rNode.m_Record && rNode.m_Record->m_pSchema != nullptr )
  {
    return rNode.m_Record->m_pSchema;
  }
  const bool bOld = rNode.m_bOld && !( rNode.m_Record && ( rNode.m_Record->m_Mask & Replaced ) != 0 );
  return bOld && rNode.m_pSchema != nullptr ? rNode.m_pSchema : pVoid;
}

VStoreModel::VRecord& VStoreModel::Acquire( const std::string& i_rPath )
{
  VNode& rNode = m_Nodes.at( i_rPath );
  if ( !rNode.m_Record )
  {
    rNode.m_Record.emplace();
    rNode.m_Record->m_Mask = rNode.m_bOld ? 0 : std::uint64_t( EAdded );
    if ( !i_rPath.empty() )
    {
      Acquire( ParentOf( i_rPath ) );
    }
  }
  return *rNode.m_Record;
}

VStoreModel::VRecord& VStoreModel::Obtain( const std::string& i_rPath )
{
  VRecord& rRecord = Acquire( i_rPath );
  if ( ( rRecord.m_Mask & ERemoved ) != 0 || !m_Nodes.at( i_rPath ).m_bOld )
  {
    rRecord.m_Mask = ( rRecord.m_Mask & ~ERemoved ) | EAdded;
    for ( std::string Path = i_rPath; !Path.empty(); )
    {
      Path = ParentOf( Path );
      std::uint64_t& rMask = m_Nodes.at( Path ).m_Record->m_Mask;
      if ( ( rMask & Replaced ) == 0 )
      {
        break;
      }
      rMask = ( rMask & ~ERemoved ) | EAdded;
    }
  }
  return rRecord;
}

VStoreModel::VRecord* VStoreModel::ObtainFor( const std::string& i_rPath, const VTypedValue& i_rValue )
{
  const IO::ISchema* const pOld = Schema( i_rPath );
  if ( i_rValue.Schema()->m_Type != IO::EType::Void && pOld->m_Type != IO::EType::Void && pOld != i_rValue.Schema() )
  {
    return nullptr;
  }
  VRecord& rRecord = Obtain( i_rPath );
  if ( rRecord.m_pSchema == nullptr && i_rValue.Schema()->m_Type != IO::EType::Void )
  {
    rRecord.m_pSchema = i_rValue.Schema();
  }
  return &rRecord;
}

IResult VStoreModel::SetTyped( const std::string& i_rPath, unsigned i_Bit, const VTypedValue& i_rValue )
{
  VRecord* const pRecord = ObtainFor( i_rPath, i_rValue );
  if ( pRecord == nullptr )
  {
    return IResult::InvalidType;
  }
  const std::uint32_t Word = Flags( i_rPath );
  const bool bVerify = ( Word & EVerifyRequired ) != 0;
  const unsigned Field = i_Bit == 0 ? ( bVerify ? 17 : 16 ) : i_Bit;
  pRecord->m_Fields[Field] = FieldOf( i_rValue );
  pRecord->m_Mask |= Bit( Field );
  const bool bClears = i_Bit == 0 || i_Bit == 17 || ( i_Bit == 16 && !bVerify );
  if ( bClears && ( Word & EUsingDefault ) != 0 )
  {
    pRecord->m_Flags &= ~std::uint32_t( EUsingDefault );
    pRecord->m_Mask |= EUsingDefault;
  }
  return IResult::Ok;
}

IResult VStoreModel::SetDefault( const std::string& i_rPath, const VTypedValue& i_rValue )
{
  if ( ObtainFor( i_rPath, i_rValue ) == nullptr )
  {
    return IResult::InvalidType;
  }
  const std::uint32_t Word = Flags( i_rPath );
  const unsigned Slot = ( Word & EVerifyRequired ) != 0 ? 17 : 16;
  if ( !HasBytes( Read( i_rPath, 18 ) ) )
  {
    if ( !HasBytes( Read( i_rPath, Slot ) ) )
    {
      (void)SetTyped( i_rPath, Slot, i_rValue );
      SetFlags( i_rPath, EUsingDefault, true );
    }
  }
  else if ( ( Word & EUsingDefault ) != 0 )
  {
    (void)SetTyped( i_rPath, 0, i_rValue );
  }
  SetPlain( i_rPath, 18, FieldOf( i_rValue ) );
  return IResult::Ok;
}

void VStoreModel::SetFlags( const std::string& i_rPath, std::uint32_t i_Flags, bool i_bOn )
{
  VRecord& rRecord = Obtain( i_rPath );
  const bool bOld = m_Nodes.at( i_rPath ).m_bOld;
  const std::uint32_t Word = Flags( i_rPath );
  if ( ( i_Flags & EVerifyRequired ) != 0 && bOld && ( ( Word & EVerifyRequired ) != 0 ) != i_bOn )
  {
    Swap( i_rPath );
  }
  if ( i_bOn && ( i_Flags & EReadout ) != 0 && bOld && ( Word & EReadout ) == 0 )
  {
    EmptyForReadout( i_rPath, rRecord );
  }
  rRecord.m_Flags = i_bOn ? rRecord.m_Flags | i_Flags : rRecord.m_Flags & ~i_Flags;
  rRecord.m_Mask |= i_Flags;
}

namespace
{
/// The value that a field was made of.
VTypedValue ValueOf( const VModelField& i_rField )
{
  VTypedValue Value;
  if ( !i_rField.empty() )
  {
    Value.m_pSchema = IO::GetUniquePodSchema( static_cast< IO::EType >( i_rField.front()[0] - 'A' ) );
    Value.m_Data.Append( i_rField.front().data() + 1, i_rField.front().size() - 1 );
  }
  return Value;
}
} // namespace

void VStoreModel::Swap( const std::string& i_rPath )
{
  const VTypedValue Verified = ValueOf( Read( i_rPath, 16 ) );
  const VTypedValue Proposed = ValueOf( Read( i_rPath, 17 ) );
  if ( Verified != Proposed )
  {
    (void)SetTyped( i_rPath, 16, Proposed );
    (void)SetTyped( i_rPath, 17, Verified );
  }
}

void VStoreModel::EmptyForReadout( const std::string& i_rPath, VRecord& io_rRecord )
{
  const VRecord Saved = io_rRecord;
  (void)SetDefault( i_rPath, VTypedValue() );
  (void)SetTyped( i_rPath, 17, VTypedValue() );
  (void)SetTyped( i_rPath, 16, VTypedValue() );
  for ( const unsigned Field : { 18u, 17u, 16u } )
  {
    if ( ( Saved.m_Mask & Bit( Field ) ) != 0 )
    {
      const VTypedValue Value = ValueOf( Saved.m_Fields.at( Field ) );
      (void)( Field == 18 ? SetDefault( i_rPath, Value ) : SetTyped( i_rPath, Field, Value ) );
    }
  }
}

void VStoreModel::SetPlain( const std::string& i_rPath, unsigned i_Bit, VModelField i_Field )
{
  VRecord& rRecord = Obtain( i_rPath );
  rRecord.m_Fields[i_Bit] = std::move( i_Field );
  rRecord.m_Mask |= Bit( i_Bit );
}

void VStoreModel::Touch( const std::string& i_rPath )
{
  Obtain( i_rPath ).m_Mask |= Bit( 47 ) | Bit( 48 );
}

void VStoreModel::FillChoices( VNode& io_rNode )
{
  for ( const unsigned Field : { 26u, 27u, 28u } )
  {
    if ( ( io_rNode.m_Record->m_Mask & ( Bit( Field ) | Replaced ) ) == 0 )
    {
      io_rNode.m_Record->m_Fields[Field] = io_rNode.m_Fields[Field];
    }
    else if ( ( io_rNode.m_Record->m_Mask & Bit( Field ) ) == 0 )
    {
      io_rNode.m_Record->m_Fields[Field].clear();
    }
  }
}

IResult VStoreModel::AddChoice( const std::string& i_rPath, const VTypedValue& i_rValue, const std::string& i_rText,
                                const std::string& i_rToolTip )
{
  VRecord* const pRecord = ObtainFor( i_rPath, i_rValue );
  if ( pRecord == nullptr )
  {
    return IResult::InvalidType;
  }
  FillChoices( m_Nodes.at( i_rPath ) );
  VModelField& rChoices = pRecord->m_Fields[26];
  rChoices.push_back( Encode( i_rValue ) );
  pRecord->m_Mask |= Bit( 26 );
  for ( const auto& [Field, rText] : { std::pair( 27u, i_rText ), std::pair( 28u, i_rToolTip ) } )
  {
    VModelField& rTexts = pRecord->m_Fields[Field];
    if ( !rText.empty() || !rTexts.empty() )
    {
      rTexts.resize( rChoices.size() );
      rTexts.back() = rText;
      pRecord->m_Mask |= Bit( Field );
    }
  }
  return IResult::Ok;
}

IResult VStoreModel::RemoveChoice( const std::string& i_rPath, std::size_t i_Index )
{
  if ( i_Index >= Read( i_rPath, 26 ).size() )
  {
    return IResult::InvalidIndex;
  }
  VRecord& rRecord = Obtain( i_rPath );
  FillChoices( m_Nodes.at( i_rPath ) );
  for ( const unsigned Field : { 26u, 27u, 28u } )
  {
    VModelField& rList = rRecord.m_Fields[Field];
    if ( i_Index < rList.size() )
    {
      rList.erase( rList.begin() + static_cast< std::ptrdiff_t >( i_Index ) );
    }
    rRecord.m_Mask |= Bit( Field );
  }
  DropIfAllEmpty( rRecord.m_Fields[27] );
  DropIfAllEmpty( rRecord.m_Fields[28] );
  return IResult::Ok;
}

IResult VStoreModel::ClearChoices( const std::string& i_rPath )
{
  if ( Read( i_rPath, 26 ).empty() )
  {
    return IResult::OkButNoEffect;
  }
  SetPlain( i_rPath, 26, {} );
  SetPlain( i_rPath, 27, {} );
  VNode& rNode = m_Nodes.at( i_rPath );
  rNode.m_Record->m_Fields[28].clear();
  if ( rNode.m_bOld && !rNode.m_Fields[28].empty() )
  {
    rNode.m_Record->m_Mask |= Bit( 28 );
  }
  return IResult::Ok;
}

IResult VStoreModel::SetToolTip( const std::string& i_rPath, std::size_t i_Index, const std::string& i_rText )
{
  const std::size_t Count = Read( i_rPath, 26 ).size();
  if ( i_Index >= Count )
  {
    return IResult::InvalidIndex;
  }
  Obtain( i_rPath );
  FillChoices( m_Nodes.at( i_rPath ) );
  VModelField ToolTips = m_Nodes.at( i_rPath ).m_Record->m_Fields[28];
  ToolTips.resize( Count );
  ToolTips[i_Index] = i_rText;
  DropIfAllEmpty( ToolTips );
  SetPlain( i_rPath, 28, std::move( ToolTips ) );
  return IResult::Ok;
}

IResult VStoreModel::SetSchema( const std::string& i_rPath, const IO::ISchema* i_pSchema )
{
  const IO::ISchema* const pOld = Schema( i_rPath );
  if ( pOld == i_pSchema )
  {
    return IResult::OkButNoEffect;
  }
  if ( pOld->m_Type != IO::EType::Void )
  {
    return IResult::InvalidType;
  }
  Obtain( i_rPath ).m_pSchema = i_pSchema;
  return IResult::Ok;
}

} // namespace Store
