#include "metadata_framework/par_element.h"

int parElement::setElement(const char* theName, void* theValue, ParameterType theType, int theCount,
                           double theMin, double theMax, bool theMandatory) {
  name = theName != nullptr ? theName : "";
  value = theValue;
  type = theType;
  count = theCount;
  min = theMin;
  max = theMax;
  mandatory = theMandatory;
  if (!registered) scalar = (theCount == 1);
  return 0;
}
