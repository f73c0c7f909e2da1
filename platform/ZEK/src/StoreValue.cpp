#include <ZEK/Log.h>
#include <ZEK/StoreValue.h>

#include <boost/format.hpp>

#include <exception>
#include <string>

namespace ZEK
{
namespace
{
VLogCategory& StoreCategory()
{
  static VLogCategory& rCategory = GlobalLog().Category( "Store" );
  return rCategory;
}

struct VReadFailure
{
  IResult::ECode Code;
  int Level;
  const char* pTemplate;
};

constexpr VReadFailure NotThere{ IResult::NotFound, ELogDetail, "Store entry '%1%' does not exist." };
constexpr VReadFailure NoValue{ IResult::NotSet, ELogDetail, "Store entry '%1%' has no value." };
constexpr VReadFailure Damaged{ IResult::Failed, ELogFailure,
                                "Failed getting value for store entry '%1%': encountered an unknown error." };
constexpr VReadFailure OtherType{
    IResult::InvalidType, ELogFailure,
    "Failed getting value for store entry '%1%': the requested value type does not match the store value type." };

IResult Report( const VReadFailure& i_rFailure, const std::string& i_rPath, std::string* o_pText )
{
  if ( o_pText != nullptr )
  {
    *o_pText = ( boost::format( i_rFailure.pTemplate ) % i_rPath ).str();
  }
  else
  {
    Log( StoreCategory(), i_rFailure.Level, i_rFailure.pTemplate, i_rPath );
  }
  return i_rFailure.Code;
}

const VReadFailure& Reason( const IStoreReader& i_rReader, IStoreReader::Entry i_pEntry, const IO::ISchema* i_pWanted )
{
  if ( i_pEntry == nullptr || !i_rReader.Exists( i_pEntry ) )
  {
    return NotThere;
  }
  const VTypedValue& rValue = i_rReader.VerifiedValue( i_pEntry );
  if ( rValue.IsEmpty() )
  {
    return NoValue;
  }
  return rValue.Schema() == i_pWanted ? Damaged : OtherType;
}
} // namespace

VStoreException::VStoreException( IResult i_Result, const std::string& i_rText )
  : std::runtime_error( i_rText )
  , m_Result( i_Result )
{
}

VStoreException::~VStoreException() = default;

namespace StoreDetail
{

IResult ReadFailed( const IStoreReader& i_rReader, IStoreReader::Entry i_pEntry, const IO::ISchema* i_pWanted,
                    std::string* o_pText )
{
  static const std::string NoPath;
  const std::string& rPath = i_pEntry != nullptr ? i_rReader.GetStore()->EntryPath( i_pEntry ).Text() : NoPath;
  return Report( Reason( i_rReader, i_pEntry, i_pWanted ), rPath, o_pText );
}

IStoreReader::Entry FindForRead( const IStoreReader& i_rReader, const VEntryPath& i_rPath, IResult& o_rResult )
{
  if ( i_rPath.HasWildcard() )
  {
    o_rResult = IResult::InvalidArgument;
    return nullptr;
  }
  const IStoreReader::Entry pEntry = i_rReader.GetStore()->FindEntry( i_rPath );
  if ( pEntry == nullptr )
  {
    o_rResult = Report( NotThere, i_rPath.Text(), nullptr );
  }
  return pEntry;
}

void ScopeFailed()
{
  if ( std::uncaught_exceptions() == 0 )
  {
    throw;
  }
  std::string Text = "unknown";
  try
  {
    throw;
  }
  catch ( const std::exception& rError )
  {
    Text = rError.what();
  }
  catch ( ... )
  {
  }
  Log( StoreCategory(), ELogFailure, "A callback failed while another failure was on its way: %1%.", Text );
}

} // namespace StoreDetail
} // namespace ZEK
