#pragma once

#include <HostServices/VPreferenceEditor.h>

#include <QtWidgets/QDialog>
#include <QtWidgets/QLabel>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QScrollArea>

#include <memory>
#include <vector>

namespace HostWindow
{

/// The preferences of the store, made from what their entries say of themselves. Every change holds at once and is a
/// step of the undo stack; changes from elsewhere appear as they come. Thread: GUI.
class VPreferencesWindow : public QDialog
{
  Q_OBJECT

public:
  /// The editor and the stack outlive the window; the service brings the store's changes to this thread.
  VPreferencesWindow( HostServices::VPreferenceEditor& io_rEditor, HostServices::VUndoStack& io_rUndo,
                      std::shared_ptr< ZEK::IPostalService > i_pPostal, QWidget* i_pParent = nullptr );
  ~VPreferencesWindow() override;

protected:
  void changeEvent( QEvent* io_pEvent ) override;
  void keyPressEvent( QKeyEvent* io_pEvent ) override;
  void showEvent( QShowEvent* io_pEvent ) override;

private:
  struct VPage;

  void MakeParts();
  void Watch( std::shared_ptr< ZEK::IPostalService > i_pPostal );
  /// Shows the store of now; the page is made anew only when other preferences are there.
  void Refresh();
  void ShowValues();
  void MakePage();
  void MakeTabOrder();
  void Search();

  HostServices::VPreferenceEditor& m_rEditor;
  std::unique_ptr< VPage > m_pPage;
  QLineEdit* m_pSearch = nullptr;
  QScrollArea* m_pScroll = nullptr;
  QLabel* m_pNothing = nullptr;
  QLabel* m_pMessage = nullptr;
  QPushButton* m_pClose = nullptr;
  ZEK::VConnection m_StoreConnection;
  ZEK::VConnection m_FailedConnection;
};

} // namespace HostWindow
