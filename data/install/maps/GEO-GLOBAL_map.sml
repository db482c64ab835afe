<?xml version="1.0" ?>
<HEADER_INFO xmlns="urn:veloran:schemas:header"
	xmlns:xsi="http://www.w3.org/2001/XMLSchema-instance"
	xsi:schemaLocation="urn:veloran:schemas:header
	urn:veloran:schemas:header/VeloranHeaderSchema_version_1.0.xsd">
   <state>
      <state_GEO-GLOBAL>GEO-GLOBAL</state_GEO-GLOBAL>
   </state>
   <hemisphere>
      <hemisphere_NORTH>NORTH</hemisphere_NORTH>
      <hemisphere_SOUTH>SOUTH</hemisphere_SOUTH>
   </hemisphere>
   <projection>
      <projection_NONE>NONE</projection_NONE>
   </projection>
   <zone>
      <zone_0>0</zone_0>
   </zone>
   <ellipsoid>
      <ellipsoid_WGS84>WGS84</ellipsoid_WGS84>
   </ellipsoid>
   <datumshift>
      <datumshift_NONE>NONE</datumshift_NONE>
   </datumshift>
</HEADER_INFO>
