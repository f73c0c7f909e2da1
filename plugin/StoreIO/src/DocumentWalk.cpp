#include "DocumentWalk.h"

#include "DocumentKeys.h"
#include "JsonWriter.h"
#include "LeafCodec.h"

#include <StoreIO/StoreJson.h>
#include <ZEK/Store.h>
#include <ZEK/StoreFlags.h>
#include <ZEK/TypedValueText.h>

#include <boost/format.hpp>

#include <algorithm>
#include <iterator>
#include <utility>

namespace StoreIO
{

using namespace ZEK;

namespace
{
template < typename... TArguments >
std::string Format( const char* i_pTemplate, const TArguments&... i_rArguments )
{
  boost::format Text( i_pTemplate );
  (void)( Text % ... % i_rArguments );
  return Text.str();
}

std::size_t Components( const std::string& i_rPath )
{
  return static_cast< std::size_t >( std::count( i_rPath.begin(), i_rPath.end(), '/' ) ) + 1;
}

std::string XPath( const VEntryPath& i_rPath )
{
  std::string Text = "/Configuration";
  std::string_view Left = i_rPath.Text();
  for ( bool bMore = !Left.empty(); bMore; )
  {
    const std::size_t End = Left.find( '/' );
    Text.append( "/Node[@name='" ).append( Left.substr( 0, End ) ).append( "']" );
    bMore = End != std::string_view::npos;
    Left.remove_prefix( bMore ? End + 1 : Left.size() );
  }
  return Text;
}

bool IsSchemaKey( std::string_view i_Name )
{
  constexpr std::string_view Keys[] = { "Type",       "Role",       "Detail", "Count",  "TypeName",
                                        "EnumValues", "SubSchemas", "Docs",   "History" };
  return std::find( std::begin( Keys ), std::end( Keys ), i_Name ) != std::end( Keys );
}
} // namespace

VDocumentWalk::VDocumentWalk( IStoreWriter* io_pWriter )
  : m_pWriter( io_pWriter )
  , m_Levels( MaximumComponents + 2 )
{
}

IResult VDocumentWalk::Run( const rapidjson::Value& i_rRoot )
{
  const IResult Result = Head( i_rRoot );
  if ( Result.IsError() )
  {
    return Result;
  }
  if ( m_Errors.size() > m_Remarks )
  {
    return m_bTooDeep ? IResult::InvalidFormat : IResult::Failed;
  }
  return m_Refusals + m_Remarks != 0 ? IResult::OkButPartial : IResult::Ok;
}

IResult VDocumentWalk::Head( const rapidjson::Value& i_rRoot )
{
  if ( !i_rRoot.IsObject() || i_rRoot.ObjectEmpty() )
  {
    const bool bObject = i_rRoot.IsObject();
    Remark( bObject ? "The document is an empty object" : "The document is not an object" );
    return bObject ? IResult::FileNotOpen : IResult::InvalidFormat;
  }
  if ( m_pWriter == nullptr )
  {
    RemarkMembers( i_rRoot, VEntryPath(), false );
  }
  const IResult Result = Version( i_rRoot );
  if ( Result.IsError() && m_pWriter != nullptr )
  {
    return Result;
  }
  const auto Children = i_rRoot.FindMember( KeyChildren.data() );
  if ( Children == i_rRoot.MemberEnd() )
  {
    m_Errors.emplace_back( "The file has no top-level \"data\" member to read" );
  }
  else if ( !Children->value.IsObject() )
  {
    m_Errors.emplace_back( "The value stored under the member \"data\" is not an object" );
  }
  else
  {
    Walk( Children->value );
  }
  return Result;
}

IResult VDocumentWalk::Version( const rapidjson::Value& i_rRoot )
{
  IO::VVersion Found = OldestVersion;
  const auto Member = i_rRoot.FindMember( KeyVersion.data() );
  if ( Member != i_rRoot.MemberEnd() )
  {
    if ( !Member->value.IsString() )
    {
      m_Errors.push_back(
          Format( "The file format version element \"%1%\" is not a string type json element", KeyVersion ) );
      return IResult::InvalidVersion;
    }
    if ( !IO::VersionFromText( TextOf( Member->value ), Found ) )
    {
      m_Errors.push_back( Format( "The file format version element \"%1%\" is invalid.", KeyVersion ) );
      return IResult::InvalidVersion;
    }
  }
  if ( Found < MinimumVersion )
  {
    m_Errors.push_back(
        Format( "StoreFileReader cannot load IStore file with version %1%, minimum supported version is %2%",
                IO::VersionToText( Found ), IO::VersionToText( MinimumVersion ) ) );
    return IResult::InvalidVersion;
  }
  if ( Found > MaximumVersion )
  {
    m_Errors.push_back( Format( "Cannot load IStore file with version %1%, maximum supported version is %2%",
                                IO::VersionToText( Found ), IO::VersionToText( MaximumVersion ) ) );
    return IResult::InvalidVersion;
  }
  return IResult::Ok;
}

void VDocumentWalk::Walk( const rapidjson::Value& i_rChildren )
{
  Open( i_rChildren, m_pWriter != nullptr ? m_pWriter->GetStore()->GetRootEntry() : nullptr );
  while ( !m_Open.empty() )
  {
    VOpen& rTop = m_Open.back();
    if ( rTop.m_Next == rTop.m_End )
    {
      m_Open.pop_back();
      continue;
    }
    const auto& rMember = *rTop.m_Next++;
    if ( !rMember.value.IsObject() )
    {
      NotAnObject( TextOf( rMember.name ), PathAt( m_Open.size() - 1 ) );
      rTop.m_Next = m_pWriter != nullptr ? rTop.m_End : rTop.m_Next;
      continue;
    }
    Enter( TextOf( rMember.name ) );
    m_pEntry = FindKnown( rTop );
    Node( rMember.value );
  }
}

/// At the place of the current node.
void VDocumentWalk::Open( const rapidjson::Value& i_rChildren, IStoreReader::Entry i_pEntry )
{
  if ( m_pWriter == nullptr )
  {
    RemarkMembers( i_rChildren, Path(), false );
  }
  m_Open.push_back( { i_rChildren.MemberBegin(), i_rChildren.MemberEnd(),
                      i_pEntry != nullptr ? m_pWriter->Children( i_pEntry ) : std::vector< IStoreReader::Entry >() } );
}

void VDocumentWalk::Enter( std::string_view i_Name )
{
  const std::size_t Level = m_Open.size();
  const std::size_t Above = m_Levels[Level - 1].m_PathSize;
  m_Levels[Level].m_Name = i_Name;
  m_Levels[Level].m_PathSize = Above + ( Above != 0 ? 1 : 0 ) + i_Name.size();
  m_PathsMade = std::min( m_PathsMade, Level - 1 );
}

const VEntryPath& VDocumentWalk::PathAt( std::size_t i_Level )
{
  for ( ; m_PathsMade < i_Level; ++m_PathsMade )
  {
    m_Levels[m_PathsMade + 1].m_Path.AssignChild( m_Levels[m_PathsMade].m_Path, m_Levels[m_PathsMade + 1].m_Name );
  }
  return m_Levels[i_Level].m_Path;
}

/// The entry of the current node if the store has it and the order of the document is that of the store, as it is
/// after an export: a walk along its children then saves looking up its path. Else null.
IStoreReader::Entry VDocumentWalk::FindKnown( VOpen& io_rOpen ) const
{
  const VLevel& rLevel = m_Levels[m_Open.size()];
  for ( ; io_rOpen.m_NextKnown < io_rOpen.m_Known.size(); ++io_rOpen.m_NextKnown )
  {
    const IStoreReader::Entry pEntry = io_rOpen.m_Known[io_rOpen.m_NextKnown];
    const VEntryPath& rPath = m_pWriter->GetStore()->EntryPath( pEntry );
    const int Order = rPath.LeafView().compare( rLevel.m_Name );
    // A path that begins with a '/' has the parent and the name of another.
    if ( Order == 0 && rPath.Text().size() == rLevel.m_PathSize )
    {
      ++io_rOpen.m_NextKnown;
      return pEntry;
    }
    if ( Order > 0 )
    {
      break;
    }
  }
  return nullptr;
}

void VDocumentWalk::Node( const rapidjson::Value& i_rNode )
{
  // The path of so many components is at least that long; members without a name add none.
  if ( m_Open.size() > MaximumComponents ||
       ( m_Levels[m_Open.size()].m_PathSize >= MaximumComponents && Components( Path().Text() ) > MaximumComponents ) )
  {
    m_bTooDeep = true;
    m_Errors.push_back( Format( "The path '%1%' has more than %2% components", Path().Text(), MaximumComponents ) );
    return;
  }
  const VNodeMembers Members( i_rNode );
  if ( m_pWriter == nullptr )
  {
    RemarkMembers( i_rNode, Path(), true );
  }
  if ( Members.m_pProposed != nullptr || Members.m_pValue != nullptr )
  {
    Values( i_rNode, Members );
  }
  if ( Members.m_pChildren != nullptr )
  {
    if ( Members.m_pChildren->IsObject() )
    {
      if ( m_pEntry == nullptr && !m_Open.back().m_Known.empty() )
      {
        m_pEntry = m_pWriter->GetStore()->FindEntry( Path() );
      }
      Open( *Members.m_pChildren, m_pEntry );
    }
    else
    {
      NotAnObject( KeyChildren, Path() );
    }
  }
}

void VDocumentWalk::Values( const rapidjson::Value& i_rNode, const VNodeMembers& i_rMembers )
{
  const IO::ISchema* const pSchema = m_Schemas.Find( i_rNode, i_rMembers );
  if ( pSchema == nullptr )
  {
    m_bTooDeep = m_bTooDeep || m_Schemas.IsTooDeep();
    m_Errors.push_back( Format( "Encountered '%1%', and unable to set value schema from '%2%'. (Element XPath=\"%3%\")",
                                Path().LeafView(), m_Schemas.Json(), XPath( Path() ) ) );
    if ( m_pWriter == nullptr )
    {
      m_Errors.back().append( ": " ).append( m_Schemas.Complaint() );
    }
    return;
  }
  if ( m_pEntry == nullptr && m_pWriter != nullptr )
  {
    m_pEntry = m_pWriter->GetStore()->GetEntry( Path() );
  }
  if ( i_rMembers.m_pProposed != nullptr )
  {
    Proposed( pSchema, *i_rMembers.m_pProposed );
  }
  if ( i_rMembers.m_pValue != nullptr )
  {
    Verified( pSchema, *i_rMembers.m_pValue );
  }
}

void VDocumentWalk::Proposed( const IO::ISchema* i_pSchema, const rapidjson::Value& i_rLeaf )
{
  VTypedValue Value = DecodeLeaf( i_pSchema, i_rLeaf );
  if ( IsEmpty( Value, KeyValueProposed ) )
  {
    return;
  }
  if ( m_pWriter == nullptr )
  {
    RemarkLeaf( i_pSchema, i_rLeaf, KeyValueProposed );
    return;
  }
  m_pWriter->SetFlag( m_pEntry, EVerifyRequired );
  m_Refusals += m_pWriter->SetProposedValue( m_pEntry, std::move( Value ) ).IsError() ? 1 : 0;
}

void VDocumentWalk::Verified( const IO::ISchema* i_pSchema, const rapidjson::Value& i_rLeaf )
{
  VTypedValue Value = DecodeLeaf( i_pSchema, i_rLeaf );
  if ( IsEmpty( Value, KeyValue ) )
  {
    return;
  }
  if ( m_pWriter == nullptr )
  {
    RemarkLeaf( i_pSchema, i_rLeaf, KeyValue );
    return;
  }
  m_Refusals += m_pWriter->SetVerifiedValue( m_pEntry, std::move( Value ) ).IsError() ? 1 : 0;
}

bool VDocumentWalk::IsEmpty( const VTypedValue& i_rValue, std::string_view i_Key )
{
  if ( i_rValue.IsEmpty() )
  {
    m_Errors.push_back( Format( "Encountered '%1%' with invalid '%2%', (Element XPath=\"%3%\")", Path().LeafView(),
                                i_Key, XPath( Path() ) ) );
  }
  return i_rValue.IsEmpty();
}

void VDocumentWalk::NotAnObject( std::string_view i_Name, const VEntryPath& i_rPath )
{
  m_Errors.push_back( Format( "Expected to encounter a json object as the value of member '%1%' at path '%2%', "
                              "(Element XPath=\"%3%\")",
                              i_Name, i_rPath.Text(), XPath( i_rPath ) ) );
}

void VDocumentWalk::Remark( std::string i_Text )
{
  if ( m_pWriter == nullptr )
  {
    m_Errors.push_back( std::move( i_Text ) );
    ++m_Remarks;
  }
}

void VDocumentWalk::RemarkLeaf( const IO::ISchema* i_pSchema, const rapidjson::Value& i_rLeaf, std::string_view i_Key )
{
  if ( const char* const pRemark = LeafRemark( i_pSchema->m_Type, i_rLeaf ) )
  {
    Remark( Format( "Encountered '%1%' whose '%2%' %3%, (Element XPath=\"%4%\")", Path().LeafView(), i_Key, pRemark,
                    XPath( Path() ) ) );
  }
}

void VDocumentWalk::RemarkMembers( const rapidjson::Value& i_rObject, const VEntryPath& i_rPath, bool i_bNode )
{
  std::vector< std::string_view > Names;
  for ( const auto& rMember : i_rObject.GetObject() )
  {
    Names.push_back( TextOf( rMember.name ) );
    if ( i_bNode && !IsReservedKey( Names.back() ) && !IsSchemaKey( Names.back() ) )
    {
      Remark( Format( "Encountered the member '%1%', which has no meaning, (Element XPath=\"%2%\")", Names.back(),
                      XPath( i_rPath ) ) );
    }
  }
  std::sort( Names.begin(), Names.end() );
  for ( auto It = std::adjacent_find( Names.begin(), Names.end() ); It != Names.end();
        It = std::adjacent_find( It, Names.end() ) )
  {
    Remark( Format( "The member '%1%' is given more than once, (Element XPath=\"%2%\")", *It, XPath( i_rPath ) ) );
    It = std::find_if( It, Names.end(),
                       [Name = *It]( std::string_view i_Other )
                       {
                         return i_Other != Name;
                       } );
  }
}

} // namespace StoreIO
