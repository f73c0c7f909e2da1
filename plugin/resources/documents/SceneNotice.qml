import QtQuick

// A sentence over a view that cannot draw, or not as it should.
Rectangle {
    id: root

    property string text

    visible: text !== ""
    width: label.width + 32
    height: label.height + 20
    radius: 5
    color: "#C0202020"
    border.color: "#E76500"

    Text {
        id: label

        anchors.centerIn: parent
        width: Math.min(implicitWidth, (root.parent ? root.parent.width : implicitWidth) - 80)
        wrapMode: Text.Wrap
        text: root.text
        color: "#F0F0F0"
        font.pixelSize: 14
    }
}
