#include <MoxelQtQuick/VQuickWidget.h>

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <QtQml/QQmlEngine>
#include <QtQuick/QQuickItem>

#include <gtest/gtest.h>

#include <fstream>

namespace
{
class VFakeQuickHost : public HarrowPluginInterface::IHarrowQuickHost
{
public:
  QQmlEngine* Engine() const override { return &m_Engine; }
  QColor ThemeColour( EThemeColour ) const override { return Qt::black; }
  ZEK::IMultiCallback< void() >& ThemeChanged() override { return m_Changed; }

private:
  mutable QQmlEngine m_Engine;
  ZEK::VMultiCallback< void() > m_Changed;
};

QUrl Write( const TestSupport::VTemporaryDir& i_rFolder, const char* i_pName, const char* i_pText )
{
  const std::filesystem::path Path = i_rFolder.Path() / i_pName;
  std::ofstream( Path ) << i_pText;
  return QUrl::fromLocalFile( QString::fromStdString( Path.string() ) );
}
} // namespace

TEST( VQuickWidget, TwoWidgetsOnOneEngineKeepTheirOwnContextProperties )
{
  const TestSupport::VTemporaryDir Folder;
  const QUrl Url = Write( Folder, "A.qml", "import QtQuick\nItem { property int seen: contextNumber }" );
  const auto pHost = std::make_shared< VFakeQuickHost >();
  MoxelQtQuick::VQuickWidget A( pHost );
  MoxelQtQuick::VQuickWidget B( pHost );
  A.SetContextProperty( "contextNumber", 1 );
  B.SetContextProperty( "contextNumber", 2 );
  A.LoadDocument( Url );
  B.LoadDocument( Url );
  ASSERT_TRUE( A.rootObject() && B.rootObject() );
  EXPECT_EQ( A.rootObject()->property( "seen" ).toInt(), 1 );
  EXPECT_EQ( B.rootObject()->property( "seen" ).toInt(), 2 );
  A.SetContextProperty( "contextNumber", 7 );
  EXPECT_EQ( A.rootObject()->property( "seen" ).toInt(), 7 );
  EXPECT_EQ( B.rootObject()->property( "seen" ).toInt(), 2 );
}

TEST( VQuickWidget, ABrokenDocumentIsLoggedAndLeavesNoRoot )
{
  const TestSupport::VTemporaryDir Folder;
  const auto pHost = std::make_shared< VFakeQuickHost >();
  const QUrl Broken = Write( Folder, "Broken.qml", "import QtQuick\nItem { nonsense: 3 }" );
  const QUrl NotAnItem = Write( Folder, "Object.qml", "import QtQml\nQtObject {}" );
  MoxelQtQuick::VQuickWidget Widget( pHost );
  TestSupport::ExpectFailureLine( Broken.toString().toStdString() +
                                  ":2:8: Cannot assign to non-existent property \"nonsense\"" );
  Widget.LoadDocument( Broken );
  EXPECT_EQ( Widget.rootObject(), nullptr );
  EXPECT_EQ( TestSupport::LogTexts( "MoxelQtQuick", ZEK::ELogFailure ).size(), 1u );
  TestSupport::ExpectFailureLine( "The root of " + NotAnItem.toString().toStdString() + " is not an item" );
  Widget.LoadDocument( NotAnItem );
  EXPECT_EQ( Widget.rootObject(), nullptr );
}
