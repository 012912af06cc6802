// Lists and maps that cross between Python and the engine. Vectors returned by
// value elsewhere arrive as tuples; these classes are the full views.

%{
#include "tarsel/genotype.h"
#include "tarsel/param.h"
%}

class Genotype;
class Param;

%vector_element_access(bool)
%vector_element_access(std::string)
%vector_element_access(float)
%vector_element_access(Genotype *)
%vector_element_access(Param *)

%template(bool_vector) std::vector<bool>;
%template(string_vector) std::vector<std::string>;
%template(float_vector) std::vector<float>;
%template(genotype_vector) std::vector<Genotype *>;
%template(param_vector) std::vector<Param *>;
%template(value_map) std::map<std::string, std::vector<float> >;
