<?xml version="1.0" encoding="UTF-8"?>
<!-- The titles of a catalogue. -->
<xsl:stylesheet version="1.0" xmlns:xsl="http://www.w3.org/1999/XSL/Transform">
  <xsl:template match="/">
    <titles>
      <xsl:copy-of select="//title"/>
    </titles>
  </xsl:template>
</xsl:stylesheet>
