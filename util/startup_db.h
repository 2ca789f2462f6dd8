#pragma once
// The run-as database: under which user which instance of which agent is started and stopped.
//
//   <runas>
//   	<agent>
//   		<productCode>um</productCode>
//   		<instance>
//   			<name>inst1</name>
//   			<user>dbuser</user>
//   		</instance>
//   	</agent>
//   </runas>

#include "util/agent_entry.h"
#include "util/array.h"
#include "util/string.h"

namespace VMQ {

class DOMElement;

/// The agents of one run-as file, which it owns, in the file's order. Loaded once, by the constructor; changes reach
/// the file only through save. Belongs to one thread at a time. Pointers handed out are valid until the database is
/// destroyed or the entry removed.
class StartupDB {
 public:
  /// Reads the file. When it is missing, unreadable or not well-formed XML the database is empty; failures are traced.
  /// An agent without its productCode is dropped; the order of elements, blanks around texts and unknown elements do
  /// not matter, nor does the root's name. Kept on purpose: the user of an instance that has no name is not read.
  explicit StartupDB(const String& fileName);
  /// Copies every agent.
  StartupDB(const StartupDB& other);
  StartupDB& operator=(const StartupDB&) = delete;
  virtual ~StartupDB();

  /// Writes the model to the file, in the form above, with tabs and line feeds. Values are written as they are, in the
  /// process's code page.
  /// False, with the file untouched, when it cannot be opened for writing, or when a value would make a file that
  /// cannot be read back ("<", "&" or a carriage return, or anything else the parser rejects, such as bytes that are
  /// not UTF-8). The file is replaced in one step and keeps its mode and owner: what goes wrong once it is open (a full
  /// disk) is traced, leaves the earlier contents whole, and, kept on purpose, still returns true.
  [[nodiscard]] bool save() const;

  /// Takes ownership. Product codes may repeat; lookups find the first.
  void addAgent(AgentEntry* agent);
  /// Destroys the agent and closes the gap. Does nothing when the index is not below the count.
  void removeAgent(unsigned index);
  /// Null when the index is not below the count.
  [[nodiscard]] AgentEntry* getAgent(unsigned index) const;
  /// The first agent of exactly this product code, or null.
  [[nodiscard]] AgentEntry* getAgent(const String& productCode) const;
  [[nodiscard]] unsigned getNumAgents() const;

  /// Loads the file into the (empty) model; called by the constructor.
  void initialize();
  /// Appends the agents found directly below `root`.
  void buildModel(DOMElement* root);

 private:
  struct Empty {};
  StartupDB(const String& fileName, Empty);

  const String file_name_;
  Array<long> agents_;  // AgentEntry pointers, owned
};

}  // namespace VMQ
