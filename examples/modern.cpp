// A tour of the modern interface (corvexa/corvexa.hpp) on the sample data: classes and their
// layouts, values read and written by type, a class declared in C++, lookups, documents and files,
// and how a failure comes back. Usage: corvexa-modern [folder with inventory.xml]; it works in the
// current directory, where it writes inventory.bin.
#include <corvexa/corvexa.hpp>

#include <iostream>
#include <string>

int main(int argc, char** argv)
try {
  const std::string folder = argc > 1 ? argv[1] : CORVEXA_EXAMPLES_DIR;

  // Schema and data from one document (its schema is found at its schema location).
  corvexa::Replica inv = corvexa::Replica::read_xml_file(folder + "/inventory.xml");
  for (const corvexa::ClassDef& c : inv.classes()) {
    std::cout << c.name() << ":";
    for (const corvexa::AttributeDef& a : c.attributes()) std::cout << ' ' << a.name();  // inherited first
    std::cout << '\n';
  }

  // Values by type: get throws when there is none, try_get answers an empty optional.
  corvexa::Model parts = inv.model("Part");
  for (corvexa::Instance p : parts.instances()) {
    if (p.get<int>("quantity") < 10) p.set("quantity", 100);
    std::optional<double> weight = p.try_get<double>("weight");
    std::cout << p.get<std::string>("number") << ": " << p.get<int>("quantity") << " in stock, "
              << (weight ? std::to_string(*weight) + " kg" : std::string("weight unknown")) << '\n';
  }
  corvexa::Instance hinge = parts.create();
  hinge.set_id("P-2001");
  hinge.set("number", std::string("P-2001"));
  hinge.set("tags", std::vector<std::string>{"hinge", "steel"});
  hinge.set("supplier", *inv.find("SUP-ACME"));  // a reference to another instance
  std::cout << "P-2001 comes from " << hinge.get<corvexa::Instance>("supplier").get<std::string>("name") << '\n';

  // A class declared in C++, with a date kept to the millisecond.
  inv.define(corvexa::ClassDeclaration("Delivery")
                 .attribute(corvexa::AttributeDeclaration("part", corvexa::Type::reference).target("Part").mandatory())
                 .attribute(corvexa::AttributeDeclaration("when", corvexa::Type::date).mandatory())
                 .attribute(corvexa::AttributeDeclaration("counts", corvexa::Type::integer).multi_valued()));
  corvexa::Instance delivery = inv.model("Delivery").create();
  delivery.set("part", hinge);
  delivery.set("when", corvexa::time_point(std::chrono::milliseconds(1'700'000'000'123)));
  delivery.set("counts", std::vector<int>{10, 20});
  std::cout << "delivered "
            << delivery.get<corvexa::time_point>("when").time_since_epoch() / std::chrono::milliseconds(1)
            << " ms after 1970; " << inv.model("Bolt").select("stainless", true).size() << " stainless bolts\n";

  // Commit, then the replica as compressed bytes in a file, and back.
  inv.commit();
  inv.write_binary_file("inventory.bin", corvexa::Compression::on);
  corvexa::Replica back = corvexa::Replica::read_binary_file("inventory.bin");
  std::cout << back.model("Part").instances().size() << " parts, "
            << back.model("Delivery").instances()[0].get<std::vector<int>>("counts").size() << " counts read back\n";

  // A failure is an exception naming the operation, the cause and the last error's id.
  try {
    (void)back.model("Part").instances()[0].get<double>("quantity");
  } catch (const corvexa::Error& e) {
    std::cout << "as expected: " << e.what() << '\n';
  }
  return 0;
} catch (const corvexa::Error& e) {
  std::cerr << e.what() << '\n';
  return 1;
}
