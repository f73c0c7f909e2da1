#include <ZEK/ResultQml.h>

#include <ZEK/Result.h>

#include <QtQml/QQmlEngine>

namespace ZEK::IO
{

bool VResultNamespaceObjectQml::isOk( quint32 i_Code ) const
{
  return IResult::FromCode( i_Code ).IsOk();
}

bool VResultNamespaceObjectQml::isError( quint32 i_Code ) const
{
  return IResult::FromCode( i_Code ).IsError();
}

QString VResultNamespaceObjectQml::description( quint32 i_Code ) const
{
  return QString::fromStdString( IResult::FromCode( i_Code ).Text() );
}

quint32 VResultNamespaceObjectQml::code( const QString& i_rName ) const
{
  const std::string Prefix = i_rName.toStdString() + ":";
  const auto Named = [&]( quint32 i_Code )
  {
    return IResult::FromCode( i_Code ).Text().starts_with( Prefix );
  };
  for ( quint32 Code = IResult::Ok; Code <= IResult::OkButModified; ++Code )
  {
    if ( Named( Code ) )
    {
      return Code;
    }
  }
  for ( quint32 Code = IResult::Failed; Code <= IResult::RPCNotConnected; ++Code )
  {
    if ( Named( Code ) )
    {
      return Code;
    }
  }
  return IResult::Failed;
}

int VResultNamespaceObjectQml::category( quint32 i_Code ) const
{
  return isError( i_Code ) ? 1 : 0;
}

void RegisterResultQml()
{
  [[maybe_unused]] static const int Registered =
      qmlRegisterSingletonType< VResultNamespaceObjectQml >( "Moxel.Types", 1, 0, "Result",
                                                             []( QQmlEngine*, QJSEngine* ) -> QObject*
                                                             {
                                                               return new VResultNamespaceObjectQml;
                                                             } );
}

} // namespace ZEK::IO
