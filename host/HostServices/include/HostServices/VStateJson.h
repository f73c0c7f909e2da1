#pragma once

#include <HarrowPluginInterface/IWorkspaceContent.h>

#include <QtCore/QJsonObject>

namespace HostServices
{

/// Writes a window's state as a JSON object with one object a group. A value that is neither a finite number, a bool,
/// a text nor a list of texts, and a whole number beyond 63 bits, is left out with a log line of level 3. A group that
/// is opened again goes on where it ended.
class VStateJsonWriter final : public HarrowPluginInterface::IStateWriter
{
public:
  void BeginGroup( const QString& i_rName ) override;
  void EndGroup() override;
  void Write( const QString& i_rName, const QVariant& i_rValue ) override;

  /// What was written so far, groups that are still open included.
  QJsonObject Object() const;

private:
  struct VGroup
  {
    QString Name;
    QJsonObject Values;
  };
  std::vector< VGroup > m_Groups = std::vector< VGroup >( 1 );
};

/// Reads what `VStateJsonWriter` wrote. A number that the asked type cannot hold, or that has a fraction where a
/// whole number is asked, is of another type.
class VStateJsonReader final : public HarrowPluginInterface::IStateReader
{
public:
  explicit VStateJsonReader( QJsonObject i_Object )
    : m_Object( std::move( i_Object ) )
  {
  }

  bool Has( const QString& i_rName ) const override { return m_Object.contains( i_rName ); }
  ZEK::IResult Read( const QString& i_rName, QMetaType i_Type, QVariant& o_rValue ) const override;
  std::unique_ptr< HarrowPluginInterface::IStateReader > Child( const QString& i_rName ) const override;

private:
  QJsonObject m_Object;
};

} // namespace HostServices
