#pragma once

#include <string>
#include <sys/types.h>

namespace HostWindow
{

/// A virtual X server of the program's own. It ends with the program, also when the program crashes.
class VPrivateDisplay
{
public:
  VPrivateDisplay() = default;
  VPrivateDisplay( const VPrivateDisplay& ) = delete;
  VPrivateDisplay& operator=( const VPrivateDisplay& ) = delete;
  ~VPrivateDisplay();

  /// Starts the server with a screen of that size and puts its name into DISPLAY. Before the application object, on
  /// the main thread. An empty text means success, anything else says what is missing.
  std::string Start( int i_Width, int i_Height );

private:
  pid_t m_Server = -1;
};

/// Whether a display that can show windows with OpenGL answers.
bool HasDisplay();

/// What Qt says goes to the log's category "Qt", warnings at level 3 and graver ones at level 2.
void RouteQtMessages();

/// Sharing, surface format, style and scene-graph back end. Before the application object.
void SetUpGraphics( bool i_bCoreProfile, double i_Ratio );

} // namespace HostWindow
